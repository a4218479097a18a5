package com.velmar.android.orv.audiomodem;

/** Receives decoded tokens from {@link NativeDecoder#nativeGetTokens}. */
public interface TokenReceiver {
  /** One decoded token's message bytes (check bytes removed). Called on the calling thread. */
  void addToken(byte[] token);
}
