package com.velmar.android.orv.audiomodem;

/** Receives the audio of one encoded token from {@link NativeEncoder#nativeEncode}. */
public interface EncodeResultReceiver {
  /**
   * Called once per successful {@code nativeEncode}, on the calling thread.
   *
   * @param startTransition fade-in to play before the token (empty for DTMF), 16-bit
   *     little-endian mono PCM
   * @param tokenAudio the token's audio in the same format; empty when the encoder refused the
   *     token (wrong length or unsupported number of check bytes)
   * @param sampleRate sample rate of both arrays, Hz
   */
  void setEncodeResults(byte[] startTransition, byte[] tokenAudio, float sampleRate);
}
