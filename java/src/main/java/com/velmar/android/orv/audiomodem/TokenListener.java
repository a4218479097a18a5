package com.velmar.android.orv.audiomodem;

/**
 * Hears what a {@link TokenStream} reports. Called on the thread that feeds the stream, inside
 * {@link TokenStream#feed}; keep the work short (hand it to another thread if it is not), and do
 * not feed the stream from here. An exception thrown here reaches the caller of {@code feed}; the
 * stream stays usable.
 */
@FunctionalInterface
public interface TokenListener {
  /** A token was heard: its first decode, or its first after going unheard for the hold time. */
  void onToken(Token token);

  /**
   * A DSSS transmitter became audible ({@code heard} true) or fell silent (false); called only on
   * changes, starting from not heard. A broadcaster is usually heard before its first token
   * decodes. DTMF streams never call it.
   */
  default void onBroadcaster(boolean heard) {}
}
