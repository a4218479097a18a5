package com.velmar.android.orv.audiomodem;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.ArrayList;
import java.util.BitSet;
import java.util.List;
import java.util.concurrent.locks.ReadWriteLock;
import java.util.concurrent.locks.ReentrantReadWriteLock;

/**
 * Listens to microphone audio and reports the tokens it hears.
 *
 * <pre>{@code
 * try (TokenDecoder decoder = TokenDecoder.create(DsssConfig.defaults(), DecoderOptions.defaults())) {
 *   while (recording) {
 *     int n = audioRecord.read(pcm, 0, pcm.length);
 *     decoder.process(pcm, 0, n);
 *     for (byte[] token : decoder.tokens()) { ... }
 *   }
 * }
 * }</pre>
 *
 * <p>The decoder keeps a history of a few token durations ({@link
 * DecoderOptions#bufferLengthTokens()}); call {@link #tokens()} at least once per such span (every
 * quarter second is typical) so that nothing heard is lost. A token heard several times is
 * reported each time it is asked for while it is in the history.
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
  private final int messageBytes;
  private final int crcCheckBytes;
  private final int channels;
  private final boolean listeningMode;
  private ByteBuffer chunk;
  private boolean closed;

  private TokenDecoder(
      int id, int messageBytes, int crcCheckBytes, int channels, boolean listeningMode) {
    this.id = id;
    this.messageBytes = messageBytes;
    this.crcCheckBytes = crcCheckBytes;
    this.channels = channels;
    this.listeningMode = listeningMode;
  }

  /** A DSSS decoder for transmitters using {@code config}. */
  public static TokenDecoder create(DsssConfig config, DecoderOptions options) {
    TABLE_LOCK.writeLock().lock();
    try {
      int id = USED_IDS.nextClearBit(0);
      TokenDecoder decoder =
          new TokenDecoder(
              id,
              config.messageBytes(),
              config.crcCheckBytes(),
              options.channels(),
              options.listeningMode());
      decoder.peer.nativeInitializeDsss(
          id,
          config.tokenLengthBytes(),
          config.checksumSymbol(),
          options.designBasebandFilter(),
          config.numberOfTaps(),
          config.codeNumber(),
          config.coderSampleRate(),
          config.upsamplingFactor(),
          config.carrierFrequency(),
          config.bitsPerSymbol(),
          config.minCyclesPerFrame(),
          config.basebandDecimationFactor(),
          config.quadratureCarrier(),
          options.acquisitionWindowSeconds(),
          options.broadcasterThreshold(),
          options.maxTokensPerCall(),
          options.microphoneRate(),
          options.channels(),
          options.bufferLengthTokens(),
          options.listeningMode());
      USED_IDS.set(id);
      return decoder;
    } finally {
      TABLE_LOCK.writeLock().unlock();
    }
  }

  /**
   * A DTMF decoder for transmitters using {@code config}. The listening mode is a DSSS feature and
   * is refused here.
   *
   * @throws IllegalArgumentException for the listening mode, or if the native library refuses the
   *     envelope
   */
  public static TokenDecoder create(DtmfConfig config, DecoderOptions options) {
    if (options.listeningMode()) {
      throw new IllegalArgumentException("the listening mode hears DSSS transmitters only");
    }
    TABLE_LOCK.writeLock().lock();
    try {
      int id = USED_IDS.nextClearBit(0);
      TokenDecoder decoder =
          new TokenDecoder(
              id, config.messageBytes(), config.crcCheckBytes(), options.channels(), false);
      float[] envelope = config.envelope();
      boolean built =
          decoder.peer.nativeInitializeDtmf(
              id,
              config.tokenLengthBytes(),
              config.checksumSymbol(),
              config.sampleRate(),
              config.basebandDecimationFactor(),
              config.windowSeconds(),
              config.tonesPerSymbol(),
              0,
              options.maxTokensPerCall(),
              options.microphoneRate(),
              options.channels(),
              envelope[0],
              envelope[1],
              envelope[2],
              envelope[3],
              envelope[4],
              options.bufferLengthTokens(),
              config.toneFrequencies());
      if (!built) {
        throw new IllegalArgumentException("the native library refused the envelope");
      }
      USED_IDS.set(id);
      return decoder;
    } finally {
      TABLE_LOCK.writeLock().unlock();
    }
  }

  /** Feeds interleaved 16-bit samples (all of {@code samples}). */
  public void process(short[] samples) {
    process(samples, 0, samples.length);
  }

  /** Feeds {@code length} interleaved 16-bit samples starting at {@code offset}. */
  public void process(short[] samples, int offset, int length) {
    if (offset < 0 || length < 0 || offset + length > samples.length) {
      throw new IndexOutOfBoundsException("offset " + offset + ", length " + length);
    }
    if (length % channels != 0) {
      throw new IllegalArgumentException("length must be a whole number of frames");
    }
    TABLE_LOCK.readLock().lock();
    try {
      synchronized (this) {
        checkOpen();
        int step = CHUNK_FRAMES * channels;
        if (chunk == null) {
          chunk = ByteBuffer.allocateDirect(2 * step).order(ByteOrder.LITTLE_ENDIAN);
        }
        for (int start = offset; start < offset + length; start += step) {
          int count = Math.min(step, offset + length - start);
          chunk.clear();
          chunk.asShortBuffer().put(samples, start, count);
          feed(chunk, 0, 2 * count);
        }
      }
    } finally {
      TABLE_LOCK.readLock().unlock();
    }
  }

  /**
   * Feeds 16-bit little-endian interleaved PCM from a direct buffer. In the listening mode the
   * region may be overwritten (multi-channel input is mixed down in place).
   */
  public void process(ByteBuffer directPcm, int offsetBytes, int lengthBytes) {
    if (!directPcm.isDirect()) {
      throw new IllegalArgumentException("the buffer must be direct");
    }
    if (offsetBytes < 0
        || lengthBytes < 0
        || offsetBytes % 2 != 0
        || lengthBytes % (2 * channels) != 0
        || (long) offsetBytes + lengthBytes > directPcm.capacity()) {
      throw new IllegalArgumentException(
          "region must be whole frames of 16-bit samples inside the buffer");
    }
    TABLE_LOCK.readLock().lock();
    try {
      synchronized (this) {
        checkOpen();
        int step = 2 * CHUNK_FRAMES * channels;
        for (int start = offsetBytes; start < offsetBytes + lengthBytes; start += step) {
          feed(directPcm, start, Math.min(step, offsetBytes + lengthBytes - start));
        }
      }
    } finally {
      TABLE_LOCK.readLock().unlock();
    }
  }

  private void feed(ByteBuffer buffer, int offsetBytes, int lengthBytes) {
    if (listeningMode) {
      peer.nativeProcessSamplesWithZintar(id, buffer, offsetBytes, lengthBytes);
    } else {
      peer.nativeProcessSamples(id, buffer, offsetBytes, lengthBytes);
    }
  }

  /** The tokens in the history now (message bytes, check bytes verified and removed). */
  public List<byte[]> tokens() {
    List<byte[]> tokens = new ArrayList<>();
    TABLE_LOCK.readLock().lock();
    try {
      synchronized (this) {
        checkOpen();
        peer.nativeGetTokens(id, (TokenReceiver) tokens::add, messageBytes, crcCheckBytes);
      }
    } finally {
      TABLE_LOCK.readLock().unlock();
    }
    return tokens;
  }

  /** Whether a transmitter is audible now (it may not be decodable yet). */
  public boolean broadcasterDetected() {
    TABLE_LOCK.readLock().lock();
    try {
      synchronized (this) {
        checkOpen();
        return peer.nativeDetectBroadcaster(id);
      }
    } finally {
      TABLE_LOCK.readLock().unlock();
    }
  }

  /** Forgets everything heard so far. */
  public void wipe() {
    TABLE_LOCK.readLock().lock();
    try {
      synchronized (this) {
        checkOpen();
        peer.nativeWipeInternalData(id);
      }
    } finally {
      TABLE_LOCK.readLock().unlock();
    }
  }

  /** 16-bit samples (all channels) the next native call may carry without dropping history. */
  public int maxSafeInputSamples() {
    TABLE_LOCK.readLock().lock();
    try {
      synchronized (this) {
        checkOpen();
        return peer.nativeGetMaxSafeInputSize(id) / 2;
      }
    } finally {
      TABLE_LOCK.readLock().unlock();
    }
  }

  /** Frees the native decoder. Idempotent. */
  @Override
  public void close() {
    TABLE_LOCK.writeLock().lock();
    try {
      synchronized (this) {
        if (!closed) {
          peer.nativeRelease(id);
          USED_IDS.clear(id);
          closed = true;
        }
      }
    } finally {
      TABLE_LOCK.writeLock().unlock();
    }
  }

  private void checkOpen() {
    if (closed) {
      throw new IllegalStateException("decoder is closed");
    }
  }
}
