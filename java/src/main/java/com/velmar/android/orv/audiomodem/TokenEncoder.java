package com.velmar.android.orv.audiomodem;

/**
 * Turns message bytes into audio for a loudspeaker.
 *
 * <pre>{@code
 * try (TokenEncoder encoder = TokenEncoder.create(DsssConfig.defaults())) {
 *   EncodedToken token = encoder.encode(new byte[] {1, 2, 3, 4, 5, 6});
 *   audioTrack.write(token.playback(3), 0, ...);
 * }
 * }</pre>
 *
 * <p>The native library holds one encoder per process, so creating an encoder retires the
 * previous one: using a retired encoder throws {@link IllegalStateException}. Thread-safe: calls
 * are serialised on a process-wide lock.
 */
public final class TokenEncoder implements AutoCloseable {
  private static final Object LOCK = new Object();
  private static TokenEncoder current; // The encoder that owns the native slot.

  private final NativeEncoder peer = new NativeEncoder();
  private final int messageBytes;
  private final int crcCheckBytes;
  private boolean closed;

  private TokenEncoder(int messageBytes, int crcCheckBytes) {
    this.messageBytes = messageBytes;
    this.crcCheckBytes = crcCheckBytes;
  }

  /** A DSSS encoder for {@code config}; retires any previous encoder. */
  public static TokenEncoder create(DsssConfig config) {
    synchronized (LOCK) {
      TokenEncoder encoder = new TokenEncoder(config.messageBytes(), config.crcCheckBytes());
      encoder.peer.nativeInitializeDsss(config.tokenLengthBytes(), config.checksumSymbol(),
          config.singleSideband(), config.numberOfTaps(), config.codeNumber(),
          config.coderSampleRate(), config.upsamplingFactor(), config.carrierFrequency(),
          config.bitsPerSymbol(), config.minCyclesPerFrame(), config.basebandDecimationFactor(),
          config.quadratureCarrier(), config.broadcastSampleRate(), config.transitionSeconds());
      current = encoder;
      return encoder;
    }
  }

  /**
   * A DTMF encoder for {@code config}; retires any previous encoder.
   *
   * @throws IllegalArgumentException if the native library refuses the envelope
   */
  public static TokenEncoder create(DtmfConfig config) {
    synchronized (LOCK) {
      TokenEncoder encoder = new TokenEncoder(config.messageBytes(), config.crcCheckBytes());
      DtmfConfig.Envelope envelope = config.envelope();
      boolean built = encoder.peer.nativeInitializeDtmf(config.tokenLengthBytes(),
          config.checksumSymbol(), config.sampleRate(), config.basebandDecimationFactor(),
          config.windowSeconds(), config.tonesPerSymbol(), envelope.attackSeconds(),
          envelope.decaySeconds(), envelope.sustainSeconds(), envelope.releaseSeconds(),
          envelope.sustainLevel(), config.toneFrequencies());
      if (!built) {
        throw new IllegalArgumentException("the native library refused the envelope");
      }
      current = encoder;
      return encoder;
    }
  }

  /** Message bytes that {@link #encode} expects. */
  public int messageBytes() {
    return messageBytes;
  }

  /**
   * Encodes one token.
   *
   * @throws IllegalArgumentException if {@code message} does not have {@link #messageBytes()}
   *     bytes
   * @throws IllegalStateException if this encoder was closed or retired by a newer one
   */
  public EncodedToken encode(byte[] message) {
    if (message == null || message.length != messageBytes) {
      throw new IllegalArgumentException("message must have " + messageBytes + " bytes");
    }
    synchronized (LOCK) {
      checkCurrent();
      Receiver receiver = new Receiver();
      peer.nativeEncode(message, receiver, crcCheckBytes);
      if (receiver.tokenAudio == null || receiver.tokenAudio.length == 0) {
        throw new IllegalStateException("the native encoder refused the token");
      }
      return new EncodedToken(receiver.startTransition, receiver.tokenAudio, receiver.sampleRate);
    }
  }

  /** Frees the native encoder if this one still owns it. Idempotent. */
  @Override
  public void close() {
    synchronized (LOCK) {
      if (current == this) {
        peer.nativeRelease();
        current = null;
      }
      closed = true;
    }
  }

  private void checkCurrent() {
    if (closed) {
      throw new IllegalStateException("encoder is closed");
    }
    if (current != this) {
      throw new IllegalStateException("encoder was retired by a newer TokenEncoder");
    }
  }

  private static final class Receiver implements EncodeResultReceiver {
    byte[] startTransition;
    byte[] tokenAudio;
    float sampleRate;

    @Override
    public void setEncodeResults(byte[] startTransition, byte[] tokenAudio, float sampleRate) {
      this.startTransition = startTransition;
      this.tokenAudio = tokenAudio;
      this.sampleRate = sampleRate;
    }
  }
}
