package com.velmar.android.orv.audiomodem;

import java.util.Arrays;
import java.util.Locale;

/**
 * One sighting of a token, as a {@link TokenStream} reports it. Immutable.
 *
 * <p>Times are stream times: the frames fed to the stream so far divided by the microphone rate,
 * taken when the stream polled its decoder. A sighting is reported at its first decode, so in a
 * report {@link #lastHeardSeconds()} equals {@link #firstHeardSeconds()}.
 */
public final class Token {
  /** {@link #modem()} of tokens from the DSSS modem. */
  public static final String DSSS = "dsss";
  /** {@link #modem()} of tokens from the DTMF modem. */
  public static final String DTMF = "dtmf";

  private final byte[] message;
  private final String modem;
  private final double firstHeardSeconds;
  private final double lastHeardSeconds;

  Token(byte[] message, String modem, double firstHeardSeconds, double lastHeardSeconds) {
    this.message = message.clone();
    this.modem = modem;
    this.firstHeardSeconds = firstHeardSeconds;
    this.lastHeardSeconds = lastHeardSeconds;
  }

  /** The message bytes (check bytes verified and removed); a copy. */
  public byte[] message() {
    return message.clone();
  }

  /** The modem that carried it: {@link #DSSS} ("dsss") or {@link #DTMF} ("dtmf"). */
  public String modem() {
    return modem;
  }

  /** Stream time of the poll that first decoded this sighting, seconds, at least 0. */
  public double firstHeardSeconds() {
    return firstHeardSeconds;
  }

  /** Stream time of the latest poll that decoded it, seconds, at least the first. */
  public double lastHeardSeconds() {
    return lastHeardSeconds;
  }

  @Override
  public boolean equals(Object other) {
    if (!(other instanceof Token)) {
      return false;
    }
    Token token = (Token) other;
    return Arrays.equals(message, token.message) && modem.equals(token.modem)
        && Double.compare(firstHeardSeconds, token.firstHeardSeconds) == 0
        && Double.compare(lastHeardSeconds, token.lastHeardSeconds) == 0;
  }

  @Override
  public int hashCode() {
    int hash = Arrays.hashCode(message);
    hash = 31 * hash + modem.hashCode();
    hash = 31 * hash + Double.hashCode(firstHeardSeconds);
    return 31 * hash + Double.hashCode(lastHeardSeconds);
  }

  /** For example "dsss 0a1b2c3d4e5f heard 1.750 to 1.750 s". */
  @Override
  public String toString() {
    return String.format(Locale.ROOT, "%s %s heard %.3f to %.3f s", modem, hex(message),
        firstHeardSeconds, lastHeardSeconds);
  }

  /** Lower-case hexadecimal digits of {@code bytes}, two per byte. */
  static String hex(byte[] bytes) {
    StringBuilder digits = new StringBuilder(2 * bytes.length);
    for (byte b : bytes) {
      digits.append(Character.forDigit((b >> 4) & 0xF, 16)).append(Character.forDigit(b & 0xF, 16));
    }
    return digits.toString();
  }
}
