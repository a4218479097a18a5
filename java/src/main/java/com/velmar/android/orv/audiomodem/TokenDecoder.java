package com.velmar.android.orv.audiomodem;

import static com.velmar.android.orv.audiomodem.Checks.require;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.ArrayList;
import java.util.BitSet;
import java.util.List;
import java.util.Objects;
import java.util.concurrent.locks.ReadWriteLock;
import java.util.concurrent.locks.ReentrantReadWriteLock;
import java.util.function.Supplier;

/**
 * Listens to microphone audio and reports the tokens it hears.
 *
 * <pre>{@code
 * DecoderOptions options = DecoderOptions.defaults();
 * try (TokenDecoder decoder = TokenDecoder.create(DsssConfig.defaults(), options)) {
 *   decoder.process(samples, 0, count);
 *   for (byte[] token : decoder.tokens()) { ... }
 * }
 * }</pre>
 *
 * <p>The decoder keeps a history of a few token durations ({@link
 * DecoderOptions#bufferLengthTokens()}); call {@link #tokens()} at least once per such span (every
 * quarter second is typical) so that nothing heard is lost. A token heard several times is
 * reported each time it is asked for while it is in the history. A recording loop is simpler
 * with a {@link TokenStream}, which polls for it and reports each token once per sighting.
 *
 * <p>Thread-safe: each decoder serialises its own calls, and creating or closing decoders is
 * serialised against all other calls, as the native table requires. Several decoders may be used
 * from different threads at once.
 */
public final class TokenDecoder implements AutoCloseable {
  // The native table must not change while any decoder is in use.
  private static final ReadWriteLock TABLE_LOCK = new ReentrantReadWriteLock();
  private static final BitSet USED_IDS = new BitSet();
  // Frames fed per native call: far below any history length, so that long arrays are taken in
  // as a stream instead of overrunning the decoder's buffer.
  private static final int CHUNK_FRAMES = 8192;

  private final NativeDecoder peer = new NativeDecoder();
  private final int id;
  private final String modem;
  private final int messageBytes;
  private final int crcCheckBytes;
  private final DecoderOptions options;
  private ByteBuffer chunk;
  private boolean closed;

  private TokenDecoder(
      int id, String modem, int messageBytes, int crcCheckBytes, DecoderOptions options) {
    this.id = id;
    this.modem = modem;
    this.messageBytes = messageBytes;
    this.crcCheckBytes = crcCheckBytes;
    this.options = options;
  }

  /**
   * A DSSS decoder for transmitters using {@code config}.
   *
   * @throws IllegalArgumentException if the history ({@link DecoderOptions#bufferLengthTokens()}
   *     token durations) would last more than 60 s
   */
  public static TokenDecoder create(DsssConfig config, DecoderOptions options) {
    Objects.requireNonNull(config, "config");
    Objects.requireNonNull(options, "options");
    // DsssDecoderConfigError (audio_modem_decoder.cc): what config and options check alone, and
    // the history, which needs both.
    requireHistory(config.tokenSeconds(), options);
    long floats = Limits.acquisitionHistoryFloats(config.numberOfTaps(), config.coderSampleRate(),
        config.upsamplingFactor(), config.basebandDecimationFactor(), config.carrierFrequency(),
        options.acquisitionWindowSeconds());
    require(floats <= Limits.MAX_ACQUISITION_FLOATS,
        "the acquisition window and the Doppler search would take more than "
            + (Limits.MAX_ACQUISITION_FLOATS * 4 >> 20)
            + " MiB: shorten the window or lower the carrier's cycles per frame");
    return changingTable(() -> {
      int id = USED_IDS.nextClearBit(0);
      TokenDecoder decoder =
          new TokenDecoder(id, Token.DSSS, config.messageBytes(), config.crcCheckBytes(), options);
      decoder.peer.nativeInitializeDsss(id, config.tokenLengthBytes(), config.checksumSymbol(),
          options.designBasebandFilter(), config.numberOfTaps(), config.codeNumber(),
          config.coderSampleRate(), config.upsamplingFactor(), config.carrierFrequency(),
          config.bitsPerSymbol(), config.minCyclesPerFrame(), config.basebandDecimationFactor(),
          config.quadratureCarrier(), options.acquisitionWindowSeconds(),
          options.broadcasterThreshold(), options.maxTokensPerCall(), options.microphoneRate(),
          options.channels(), options.bufferLengthTokens(), options.listeningMode());
      USED_IDS.set(id);
      return decoder;
    });
  }

  /**
   * A DTMF decoder for transmitters using {@code config}. The listening mode is a DSSS feature and
   * is refused here.
   *
   * @throws IllegalArgumentException for the listening mode, a microphone rate not within a factor
   *     1000 of the DTMF sample rate, a history ({@link DecoderOptions#bufferLengthTokens()} token
   *     durations) of more than 60 s, or if the native library refuses the envelope
   */
  public static TokenDecoder create(DtmfConfig config, DecoderOptions options) {
    Objects.requireNonNull(config, "config");
    Objects.requireNonNull(options, "options");
    require(!options.listeningMode(), "the listening mode hears DSSS transmitters only");
    // DtmfDecoderConfigError (audio_modem_decoder.cc): what config and options check alone, the
    // rate ratio, which the resampler approximates by a fraction of denominator 2000 at most, and
    // the history.
    float ratio = options.microphoneRate() / config.sampleRate();
    require(ratio >= Limits.MIN_DTMF_RATE_RATIO && ratio <= Limits.MAX_DTMF_RATE_RATIO,
        "the microphone rate (" + options.microphoneRate()
            + " Hz) must be within a factor 1000 of the DTMF sample rate (" + config.sampleRate()
            + " Hz)");
    requireHistory(config.tokenSeconds(), options);
    return changingTable(() -> {
      int id = USED_IDS.nextClearBit(0);
      TokenDecoder decoder =
          new TokenDecoder(id, Token.DTMF, config.messageBytes(), config.crcCheckBytes(), options);
      DtmfConfig.Envelope envelope = config.envelope();
      boolean built = decoder.peer.nativeInitializeDtmf(id, config.tokenLengthBytes(),
          config.checksumSymbol(), config.sampleRate(), config.basebandDecimationFactor(),
          config.windowSeconds(), config.tonesPerSymbol(), 0, options.maxTokensPerCall(),
          options.microphoneRate(), options.channels(), envelope.attackSeconds(),
          envelope.decaySeconds(), envelope.sustainSeconds(), envelope.releaseSeconds(),
          envelope.sustainLevel(), options.bufferLengthTokens(), config.toneFrequencies());
      if (!built) {
        throw new IllegalArgumentException("the native library refused the envelope");
      }
      USED_IDS.set(id);
      return decoder;
    });
  }

  // HistoryError (audio_modem_decoder.cc): the history lasts at most 60 s.
  private static void requireHistory(double tokenSeconds, DecoderOptions options) {
    double historySeconds = tokenSeconds * options.bufferLengthTokens();
    require(historySeconds <= Limits.MAX_HISTORY_SECONDS,
        "the history (bufferLengthTokens x " + tokenSeconds + " s per token) may last at most "
            + (int) Limits.MAX_HISTORY_SECONDS + " s, not " + historySeconds + " s");
  }

  /** The modem this decoder hears: {@link Token#DSSS} ("dsss") or {@link Token#DTMF} ("dtmf"). */
  public String modem() {
    return modem;
  }

  /** The options it was created with: the microphone's rate and channels among them. */
  public DecoderOptions options() {
    return options;
  }

  /**
   * Feeds interleaved 16-bit samples (all of {@code samples}): a whole number of frames.
   *
   * @throws NullPointerException if {@code samples} is null
   * @throws IllegalArgumentException if its length is not a whole number of frames
   * @throws IllegalStateException if the decoder is closed
   */
  public void process(short[] samples) {
    process(Objects.requireNonNull(samples, "samples"), 0, samples.length);
  }

  /**
   * Feeds {@code length} interleaved 16-bit samples starting at {@code offset}: a whole number of
   * frames (samples of all channels). Any length is taken in as a stream, a bounded piece at a
   * time.
   *
   * @throws NullPointerException if {@code samples} is null
   * @throws IndexOutOfBoundsException if the region is not inside {@code samples}
   * @throws IllegalArgumentException if {@code length} is not a whole number of frames
   * @throws IllegalStateException if the decoder is closed
   */
  public void process(short[] samples, int offset, int length) {
    Objects.requireNonNull(samples, "samples");
    if (offset < 0 || length < 0 || length > samples.length - offset) {
      throw new IndexOutOfBoundsException(
          "offset " + offset + ", length " + length + " in " + samples.length + " samples");
    }
    requireWholeFrames(length);
    run(() -> {
      ByteBuffer chunk = chunk();
      for (int done = 0; done < length;) {
        int count = Math.min(chunk.capacity() / 2, length - done);
        chunk.clear();
        chunk.asShortBuffer().put(samples, offset + done, count);
        feed(chunk, 0, 2 * count);
        done += count;
      }
    });
  }

  /**
   * Feeds 16-bit little-endian interleaved PCM from a direct buffer: {@code lengthBytes} bytes
   * from {@code offsetBytes} on (both counted from the buffer's start, whatever its position),
   * a whole number of frames. In the listening mode the region may be overwritten (multi-channel
   * input is mixed down in place), unless the buffer is read-only.
   *
   * @throws NullPointerException if {@code directPcm} is null
   * @throws IllegalArgumentException if the buffer is not direct, or the region is not whole
   *     frames of 16-bit samples inside it
   * @throws IllegalStateException if the decoder is closed
   */
  public void process(ByteBuffer directPcm, int offsetBytes, int lengthBytes) {
    Objects.requireNonNull(directPcm, "directPcm");
    require(directPcm.isDirect(), "the buffer must be direct");
    if (offsetBytes < 0 || lengthBytes < 0 || offsetBytes % 2 != 0 || lengthBytes % 2 != 0
        || (long) offsetBytes + lengthBytes > directPcm.capacity()) {
      throw new IllegalArgumentException("the region of " + lengthBytes + " bytes from "
          + offsetBytes + " must be 16-bit samples inside the buffer's " + directPcm.capacity());
    }
    requireWholeFrames(lengthBytes / 2);
    // The listening mode mixes several channels down in place, which a read-only buffer (a file
    // mapped read-only, say) cannot take: such input goes through the decoder's own buffer.
    boolean copy = directPcm.isReadOnly() && options.listeningMode() && options.channels() > 1;
    run(() -> {
      ByteBuffer chunk = copy ? chunk() : null;
      int step = 2 * CHUNK_FRAMES * options.channels();
      for (int done = 0; done < lengthBytes;) {
        int count = Math.min(step, lengthBytes - done);
        if (chunk != null) {
          ByteBuffer piece = directPcm.duplicate();
          piece.limit(offsetBytes + done + count);
          piece.position(offsetBytes + done);
          chunk.clear();
          chunk.put(piece);
          feed(chunk, 0, count);
        } else {
          feed(directPcm, offsetBytes + done, count);
        }
        done += count;
      }
    });
  }

  private void requireWholeFrames(int samples) {
    if (samples % options.channels() != 0) {
      throw new IllegalArgumentException(samples + " samples are not a whole number of frames of "
          + options.channels() + " channels");
    }
  }

  // The buffer through which arrays (and read-only buffers in the listening mode) reach the
  // library, made at first use: a bounded piece of the input at a time.
  private ByteBuffer chunk() {
    if (chunk == null) {
      chunk = ByteBuffer.allocateDirect(2 * CHUNK_FRAMES * options.channels())
                  .order(ByteOrder.LITTLE_ENDIAN);
    }
    return chunk;
  }

  private void feed(ByteBuffer buffer, int offsetBytes, int lengthBytes) {
    if (options.listeningMode()) {
      peer.nativeProcessSamplesWithZintar(id, buffer, offsetBytes, lengthBytes);
    } else {
      peer.nativeProcessSamples(id, buffer, offsetBytes, lengthBytes);
    }
  }

  /**
   * The tokens in the history now (message bytes, check bytes verified and removed), at most
   * {@link DecoderOptions#maxTokensPerCall()} of them.
   *
   * @throws IllegalStateException if the decoder is closed
   */
  public List<byte[]> tokens() {
    Collector collector = new Collector();
    run(() -> peer.nativeGetTokens(id, collector, messageBytes, crcCheckBytes));
    return collector.tokens;
  }

  /**
   * Whether a DSSS transmitter is audible now (it may not be decodable yet); always false for
   * DTMF.
   *
   * @throws IllegalStateException if the decoder is closed
   */
  public boolean broadcasterDetected() {
    return call(() -> peer.nativeDetectBroadcaster(id));
  }

  /**
   * Forgets everything heard so far.
   *
   * @throws IllegalStateException if the decoder is closed
   */
  public void wipe() {
    run(() -> peer.nativeWipeInternalData(id));
  }

  /**
   * 16-bit samples (all channels) the next native call may carry without dropping history, at
   * most {@code Integer.MAX_VALUE / 2}.
   *
   * @throws IllegalStateException if the decoder is closed
   */
  public int maxSafeInputSamples() {
    // The library answers in bytes, at most Integer.MAX_VALUE: the largest histories (a minute of
    // 64 channels at 384000 Hz) hold more, and report that much.
    return call(() -> peer.nativeGetMaxSafeInputSize(id) / 2);
  }

  // The native id of this decoder, and how many ids are taken now: for tests of id reuse.
  int id() {
    return id;
  }

  static int idsInUse() {
    TABLE_LOCK.readLock().lock();
    try {
      return USED_IDS.cardinality();
    } finally {
      TABLE_LOCK.readLock().unlock();
    }
  }

  /** Frees the native decoder. Idempotent. */
  @Override
  public void close() {
    changingTable(() -> {
      synchronized (this) {
        if (!closed) {
          peer.nativeRelease(id);
          USED_IDS.clear(id);
          closed = true;
        }
      }
      return null;
    });
  }

  // Creating or releasing a native decoder: no other call may run meanwhile.
  private static <T> T changingTable(Supplier<T> change) {
    TABLE_LOCK.writeLock().lock();
    try {
      return change.get();
    } finally {
      TABLE_LOCK.writeLock().unlock();
    }
  }

  // A call on this decoder's native state: the table stays put, this decoder serves one caller.
  private <T> T call(Supplier<T> use) {
    TABLE_LOCK.readLock().lock();
    try {
      synchronized (this) {
        if (closed) {
          throw new IllegalStateException("decoder is closed");
        }
        return use.get();
      }
    } finally {
      TABLE_LOCK.readLock().unlock();
    }
  }

  private void run(Runnable use) {
    call(() -> {
      use.run();
      return null;
    });
  }

  // The receiver of nativeGetTokens: a named class rather than a lambda, so that the shrink test
  // sees the callback as an app's shrinker (which turns lambdas into such classes) does.
  private static final class Collector implements TokenReceiver {
    final List<byte[]> tokens = new ArrayList<>();

    @Override
    public void addToken(byte[] token) {
      tokens.add(token);
    }
  }
}
