package com.velmar.android.orv.audiomodem;

import static com.velmar.android.orv.audiomodem.Checks.require;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.HashMap;
import java.util.Map;
import java.util.Objects;

/**
 * Turns a recording loop into token reports: takes {@code AudioRecord.read}'s buffers and results
 * as they are, polls its decoder every quarter second of audio, and tells a {@link TokenListener}
 * about each token once per sighting.
 *
 * <pre>{@code
 * try (TokenStream stream = TokenStream.create(TokenDecoder.create(config, options), listener)) {
 *   while (recording) {
 *     stream.feed(buffer, audioRecord.read(buffer, 0, buffer.length));
 *   }
 * }
 * }</pre>
 *
 * <p>A token is reported when first decoded, and again only after it went unheard for the hold
 * time (3 s unless given) of stream time: a broadcaster repeating one token is one report, the
 * same token played again later is another, and different tokens heard together are each
 * reported. The decoder keeps hearing a token for up to {@link
 * DecoderOptions#bufferLengthTokens()} token durations after its audio ends, so a second sighting
 * needs a pause of about that plus the hold time.
 *
 * <p>Reports depend only on the audio fed, not on how it is split into calls: the stream collects
 * a quarter second ({@link #POLL_SECONDS}, rounded to whole frames) and hands it to the decoder in
 * one piece before each poll. Stream time is the number of frames fed (samples per channel)
 * divided by the microphone rate.
 *
 * <p>Not for concurrent feeding: feed from one thread (the recording thread), which is where the
 * listener runs. {@link #close()} may be called from any thread, the listener included.
 */
public final class TokenStream implements AutoCloseable {
  /** Hold time of {@link #create(TokenDecoder, TokenListener)}, seconds. */
  public static final double DEFAULT_HOLD_SECONDS = 3.0;
  /** Audio fed between two polls of the decoder, seconds, rounded to whole frames. */
  public static final double POLL_SECONDS = 0.25;

  private final TokenDecoder decoder;
  private final TokenListener listener;
  private final double holdSeconds;
  private final double rate; // Microphone frames per second.
  private final int frameBytes;
  private final boolean reportsBroadcaster;
  // The audio fed since the last poll, 16-bit little-endian; full = one poll's worth.
  private final ByteBuffer pending;
  private long polledFrames; // Frames handed to the decoder: a whole number of polls.
  // Hex message -> polledFrames of the last poll that decoded it, for tokens within the hold.
  private final Map<String, Long> lastHeard = new HashMap<>();
  private boolean broadcaster;
  private boolean closed;

  private TokenStream(TokenDecoder decoder, TokenListener listener, double holdSeconds) {
    this.decoder = decoder;
    this.listener = listener;
    this.holdSeconds = holdSeconds;
    DecoderOptions options = decoder.options();
    rate = options.microphoneRate();
    frameBytes = 2 * options.channels();
    reportsBroadcaster = decoder.modem().equals(Token.DSSS);
    long pollFrames = Math.max(1, Math.round(POLL_SECONDS * rate));
    pending =
        ByteBuffer.allocateDirect((int) pollFrames * frameBytes).order(ByteOrder.LITTLE_ENDIAN);
  }

  /** A stream over {@code decoder} with a hold of {@link #DEFAULT_HOLD_SECONDS}. */
  public static TokenStream create(TokenDecoder decoder, TokenListener listener) {
    return create(decoder, listener, DEFAULT_HOLD_SECONDS);
  }

  /**
   * A stream over {@code decoder}, which it owns from now on: closing the stream closes the
   * decoder, and so does this method when it throws.
   *
   * @param holdSeconds stream time a token must go unheard before it is reported again, seconds,
   *     finite and at least 0
   * @throws IllegalArgumentException if {@code holdSeconds} is out of range
   * @throws NullPointerException if {@code listener} is null
   */
  public static TokenStream create(
      TokenDecoder decoder, TokenListener listener, double holdSeconds) {
    try {
      Objects.requireNonNull(listener, "listener");
      require(holdSeconds >= 0 && !Double.isInfinite(holdSeconds),
          "holdSeconds must be finite and at least 0");
      return new TokenStream(decoder, listener, holdSeconds);
    } catch (RuntimeException e) {
      decoder.close();
      throw e;
    }
  }

  /**
   * Feeds what {@code AudioRecord.read(buffer, 0, buffer.length)} returned: {@code readResult}
   * interleaved samples from the start of {@code buffer}, any number of them. Polls the decoder
   * and calls the listener each time a quarter second of audio is complete.
   *
   * @param readResult samples read (0 feeds nothing), or a negative AudioRecord error code
   * @throws IllegalStateException if {@code readResult} is an error code (the message names it),
   *     or the stream is closed
   * @throws IndexOutOfBoundsException if {@code readResult} exceeds the buffer's length
   * @throws RuntimeException what the listener threw, after the whole buffer was taken in
   */
  public synchronized void feed(short[] buffer, int readResult) {
    checkRead(readResult, buffer.length);
    RuntimeException failure = null;
    for (int fed = 0; fed < readResult && !closed;) {
      int count = Math.min(readResult - fed, pending.remaining() / 2);
      pending.asShortBuffer().put(buffer, fed, count);
      pending.position(pending.position() + 2 * count);
      fed += count;
      failure = pollIfComplete(failure);
    }
    throwIfAny(failure);
  }

  /**
   * Feeds what {@code AudioRecord.read(buffer, sizeInBytes)} returned: {@code readResult} bytes of
   * 16-bit little-endian interleaved PCM from the buffer's position on, any even number of them.
   * The buffer's position and limit are left as they are. Polls as {@link #feed(short[], int)}
   * does.
   *
   * @param readResult bytes read, even (0 feeds nothing), or a negative AudioRecord error code
   * @throws IllegalStateException if {@code readResult} is an error code (the message names it),
   *     or the stream is closed
   * @throws IndexOutOfBoundsException if {@code readResult} exceeds the bytes remaining
   * @throws IllegalArgumentException if {@code readResult} is odd
   * @throws RuntimeException what the listener threw, after the whole buffer was taken in
   */
  public synchronized void feed(ByteBuffer buffer, int readResult) {
    checkRead(readResult, buffer.remaining());
    require(
        readResult % 2 == 0, "a 16-bit read returns whole samples, not " + readResult + " bytes");
    ByteBuffer source = buffer.duplicate();
    source.limit(source.position() + readResult);
    RuntimeException failure = null;
    while (source.hasRemaining() && !closed) {
      ByteBuffer piece = source.duplicate();
      piece.limit(piece.position() + Math.min(piece.remaining(), pending.remaining()));
      pending.put(piece);
      source.position(piece.position());
      failure = pollIfComplete(failure);
    }
    throwIfAny(failure);
  }

  /** Stream time now: whole frames fed so far divided by the microphone rate, seconds. */
  public synchronized double streamSeconds() {
    return (polledFrames + pending.position() / frameBytes) / rate;
  }

  /** The hold time, seconds. */
  public double holdSeconds() {
    return holdSeconds;
  }

  /**
   * Closes the stream and its decoder; audio fed since the last poll is dropped. Idempotent; may
   * be called from the listener, which then hears nothing more.
   */
  @Override
  public synchronized void close() {
    if (!closed) {
      closed = true;
      decoder.close();
    }
  }

  private void checkRead(int readResult, int available) {
    if (readResult < 0) {
      throw new IllegalStateException("AudioRecord.read failed: " + readError(readResult));
    }
    if (closed) {
      throw new IllegalStateException("stream is closed");
    }
    if (readResult > available) {
      throw new IndexOutOfBoundsException(
          "read result " + readResult + " exceeds the buffer's " + available);
    }
  }

  // The names of AudioRecord's error codes.
  private static String readError(int code) {
    switch (code) {
      case -1:
        return "ERROR (-1)";
      case -2:
        return "ERROR_BAD_VALUE (-2)";
      case -3:
        return "ERROR_INVALID_OPERATION (-3)";
      case -6:
        return "ERROR_DEAD_OBJECT (-6)";
      default:
        return "error " + code;
    }
  }

  // Polls once the pending audio is a whole poll's worth. A listener's exception is kept (the
  // first; later ones are suppressed into it) so that the rest of the buffer is still taken in.
  private RuntimeException pollIfComplete(RuntimeException failure) {
    if (pending.hasRemaining()) {
      return failure;
    }
    decoder.process(pending, 0, pending.capacity());
    pending.clear();
    polledFrames += pending.capacity() / frameBytes;
    double now = polledFrames / rate;
    if (reportsBroadcaster) {
      boolean heard = decoder.broadcasterDetected();
      if (heard != broadcaster) {
        broadcaster = heard;
        failure = deliver(() -> listener.onBroadcaster(heard), failure);
        if (closed) {
          return failure;
        }
      }
    }
    for (byte[] message : decoder.tokens()) {
      Long last = lastHeard.put(Token.hex(message), polledFrames);
      if (last == null || unheardTooLong(last)) {
        Token token = new Token(message, decoder.modem(), now, now);
        failure = deliver(() -> listener.onToken(token), failure);
      }
    }
    lastHeard.values().removeIf(this::unheardTooLong);
    return failure;
  }

  private boolean unheardTooLong(long lastHeardFrames) {
    return (polledFrames - lastHeardFrames) / rate > holdSeconds;
  }

  private RuntimeException deliver(Runnable call, RuntimeException failure) {
    if (closed) {
      return failure;
    }
    try {
      call.run();
    } catch (RuntimeException e) {
      if (failure == null) {
        return e;
      }
      if (e != failure) {
        failure.addSuppressed(e);
      }
    }
    return failure;
  }

  private static void throwIfAny(RuntimeException failure) {
    if (failure != null) {
      throw failure;
    }
  }
}
