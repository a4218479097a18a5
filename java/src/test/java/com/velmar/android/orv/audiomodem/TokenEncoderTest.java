package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;

import org.junit.jupiter.api.Test;

class TokenEncoderTest {
  private static final byte[] MESSAGE = {0x12, 0x34, 0x56, 0x78, (byte) 0x9A, (byte) 0xBC};

  @Test
  void productDefaults() {
    DsssConfig config = DsssConfig.defaults();
    assertEquals(8, config.tokenLengthBytes());
    assertEquals(2032, config.frameSize());
    assertEquals(17, config.framesPerToken());
    try (TokenEncoder encoder = TokenEncoder.create(config)) {
      EncodedToken token = encoder.encode(MESSAGE);
      assertEquals(48000f, token.sampleRate());
      assertEquals(17 * 2032, token.tokenAudio().length / 2);
      assertEquals(config.tokenSeconds(), token.tokenSeconds(), 1e-9);
      byte[] playback = token.playback(3);
      assertEquals(token.startTransition().length + 3 * token.tokenAudio().length, playback.length);
      // Encoding is deterministic.
      assertArrayEquals(token.tokenAudio(), encoder.encode(MESSAGE).tokenAudio());
    }
  }

  @Test
  void coder44100IsResampledToTheBroadcastRate() {
    try (TokenEncoder encoder = TokenEncoder.create(DsssConfig.builder().coder44100().build())) {
      assertEquals(35249, encoder.encode(MESSAGE).tokenAudio().length / 2);
    }
  }

  @Test
  void invalidValuesAreRefusedBeforeReachingNativeCode() {
    assertThrows(IllegalArgumentException.class, () -> DsssConfig.builder().code(6, 3).build());
    assertThrows(IllegalArgumentException.class, () -> DsssConfig.builder().bitsPerSymbol(3).build());
    assertThrows(
        IllegalArgumentException.class, () -> DsssConfig.builder().coder(44100f, 15, 4).build());
    assertThrows(
        IllegalArgumentException.class,
        () -> DsssConfig.builder().carrierFrequency(30000f).build());
    try (TokenEncoder encoder = TokenEncoder.create(DsssConfig.defaults())) {
      assertThrows(IllegalArgumentException.class, () -> encoder.encode(new byte[5]));
    }
  }

  @Test
  void newerEncoderRetiresTheOlder() {
    TokenEncoder first = TokenEncoder.create(DsssConfig.defaults());
    try (TokenEncoder second = TokenEncoder.create(DsssConfig.builder().crc(false).messageBytes(8).build())) {
      assertThrows(IllegalStateException.class, () -> first.encode(MESSAGE));
      assertEquals(17 * 2032, second.encode(new byte[8]).tokenAudio().length / 2);
      first.close(); // Does not free the second one's native encoder.
      assertEquals(17 * 2032, second.encode(new byte[8]).tokenAudio().length / 2);
      second.close();
      assertThrows(IllegalStateException.class, () -> second.encode(new byte[8]));
    }
  }
}
