package com.velmar.android.orv.audiomodem;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;

/** The audio of one token: 16-bit little-endian mono PCM at {@link #sampleRate()}. Immutable. */
public final class EncodedToken {
  private final byte[] startTransition;
  private final byte[] tokenAudio;
  private final float sampleRate;

  EncodedToken(byte[] startTransition, byte[] tokenAudio, float sampleRate) {
    this.startTransition = startTransition;
    this.tokenAudio = tokenAudio;
    this.sampleRate = sampleRate;
  }

  /** Fade-in to play once before the first repetition of the token (empty for DTMF). */
  public byte[] startTransition() {
    return startTransition.clone();
  }

  /** One repetition of the token. */
  public byte[] tokenAudio() {
    return tokenAudio.clone();
  }

  /** Sample rate of {@link #startTransition()} and {@link #tokenAudio()}, Hz. */
  public float sampleRate() {
    return sampleRate;
  }

  /** Duration of one repetition, seconds. */
  public double tokenSeconds() {
    return tokenAudio.length / 2 / (double) sampleRate;
  }

  /**
   * What to hand to the loudspeaker: the start transition, then the token {@code repetitions}
   * times. Receivers decode more reliably from several repetitions.
   *
   * @throws IllegalArgumentException if {@code repetitions} is below 1 or makes more than an array
   *     holds
   */
  public byte[] playback(int repetitions) {
    if (repetitions < 1) {
      throw new IllegalArgumentException("repetitions must be at least 1");
    }
    long bytes = startTransition.length + (long) repetitions * tokenAudio.length;
    if (bytes > Integer.MAX_VALUE - 8) {
      throw new IllegalArgumentException(
          repetitions + " repetitions make " + bytes + " bytes, more than an array holds");
    }
    ByteBuffer out = ByteBuffer.allocate((int) bytes);
    out.put(startTransition);
    for (int i = 0; i < repetitions; i++) {
      out.put(tokenAudio);
    }
    return out.array();
  }

  /** Converts 16-bit little-endian PCM bytes to samples. */
  public static short[] toSamples(byte[] pcm) {
    short[] samples = new short[pcm.length / 2];
    ByteBuffer.wrap(pcm).order(ByteOrder.LITTLE_ENDIAN).asShortBuffer().get(samples);
    return samples;
  }
}
