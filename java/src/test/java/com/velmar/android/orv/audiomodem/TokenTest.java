package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotEquals;

import org.junit.jupiter.api.Test;

class TokenTest {
  private static final byte[] MESSAGE = {0x0A, 0x1B, (byte) 0xFF, 0x00};

  @Test
  void holdsACopyAndPrintsHex() {
    byte[] message = MESSAGE.clone();
    Token token = new Token(message, Token.DSSS, 1.75, 2.0);
    message[0] = 9;
    byte[] copy = token.message();
    copy[1] = 9;
    assertArrayEquals(MESSAGE, token.message());
    assertEquals("dsss 0a1bff00 heard 1.750 to 2.000 s", token.toString());
  }

  @Test
  void equalityCoversEveryField() {
    Token token = new Token(MESSAGE, Token.DSSS, 1.75, 2.0);
    Token same = new Token(MESSAGE.clone(), "dsss", 1.75, 2.0);
    assertEquals(token, same);
    assertEquals(token.hashCode(), same.hashCode());
    Token[] different = {new Token(new byte[] {0x0A, 0x1B, (byte) 0xFF, 0x01}, Token.DSSS, 1.75, 2),
        new Token(MESSAGE, Token.DTMF, 1.75, 2), new Token(MESSAGE, Token.DSSS, 1.5, 2),
        new Token(MESSAGE, Token.DSSS, 1.75, 2.25)};
    for (Token other : different) {
      assertNotEquals(token, other);
      assertNotEquals(token.hashCode(), other.hashCode());
    }
    assertNotEquals(token, null);
    assertNotEquals(token, MESSAGE);
  }
}
