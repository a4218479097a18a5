package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.ArrayList;
import java.util.List;
import org.junit.jupiter.api.Test;

/**
 * The listening mode through the JNI path with any channel count: the history it hands to the DSSS
 * decoder on waking holds whole frames (counts that do not divide its capacity used to end the
 * process at the first wake-up).
 */
class ListeningModeTest {
  private static final byte[] MESSAGE = {0x21, 0x32, 0x43, 0x54, 0x65, 0x76};
  private static final DsssConfig PRODUCT = DsssConfig.defaults();

  @Test
  void everyChannelCountWakesAndDecodes() {
    for (int channels : new int[] {1, 2, 3, 4, 5, 6, 7, 8, 11, 13}) {
      DecoderOptions options = DecoderOptions.builder()
                                   .microphoneRate(48000)
                                   .channels(channels)
                                   .listeningMode(true)
                                   .build();
      short[] input = TokenDecoderTest.transmission(PRODUCT, MESSAGE, channels, channels);
      try (TokenDecoder decoder = TokenDecoder.create(PRODUCT, options)) {
        // Blocks of 1001 frames: the history's wake-up cut falls inside a block for every count.
        List<byte[]> heard = new ArrayList<>();
        for (int at = 0; at < input.length; at += 1001 * channels) {
          decoder.process(input, at, Math.min(1001 * channels, input.length - at));
          heard.addAll(decoder.tokens());
        }
        assertFalse(heard.isEmpty(), channels + " channels");
        for (byte[] token : heard) {
          assertArrayEquals(MESSAGE, token, channels + " channels");
        }
      }
    }
  }

  @Test
  void directBuffersOfOddCountsAtOddPlaces() {
    // Seven channels from an offset that is no multiple of the frame, in one call.
    int channels = 7;
    short[] samples = TokenDecoderTest.transmission(PRODUCT, MESSAGE, channels, 17);
    ByteBuffer direct =
        ByteBuffer.allocateDirect(2 * samples.length + 10).order(ByteOrder.LITTLE_ENDIAN);
    direct.position(10);
    direct.asShortBuffer().put(samples);
    DecoderOptions options = DecoderOptions.builder()
                                 .microphoneRate(48000)
                                 .channels(channels)
                                 .listeningMode(true)
                                 .build();
    try (TokenDecoder decoder = TokenDecoder.create(PRODUCT, options)) {
      decoder.process(direct, 10, 2 * samples.length);
      List<byte[]> heard = decoder.tokens();
      assertFalse(heard.isEmpty());
      assertArrayEquals(MESSAGE, heard.get(0));
    }
  }
}
