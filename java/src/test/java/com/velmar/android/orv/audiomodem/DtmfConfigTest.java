package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import org.junit.jupiter.api.Test;

class DtmfConfigTest {
  @Test
  void theEnvelopeKeepsItsSegmentsApartAndShapesEverySymbol() {
    DtmfConfig config = DtmfConfig.builder().envelope(0.004f, 0.003f, 0.002f, 0.001f, 0.5f).build();
    DtmfConfig.Envelope envelope = config.envelope();
    assertEquals(0.004f, envelope.attackSeconds());
    assertEquals(0.003f, envelope.decaySeconds());
    assertEquals(0.002f, envelope.sustainSeconds());
    assertEquals(0.001f, envelope.releaseSeconds());
    assertEquals(0.5f, envelope.sustainLevel());
    DtmfConfig.Envelope defaults = DtmfConfig.defaults().envelope();
    assertEquals(0.025f, defaults.attackSeconds());
    assertEquals(0.025f, defaults.releaseSeconds());

    // The envelope ends 10 ms into each 50 ms symbol: the rest of every symbol is silent.
    short[] audio;
    try (TokenEncoder encoder = TokenEncoder.create(config)) {
      audio = EncodedToken.toSamples(encoder.encode(new byte[] {1, 2, 3, 4, 5}).tokenAudio());
    }
    int frame = config.frameSize();
    int end = Math.round(0.010f * config.sampleRate()) + 1;
    int loudInside = 0;
    for (int i = 0; i < audio.length; i++) {
      if (i % frame >= end) {
        assertEquals(0, audio[i], "sample " + i);
      } else if (Math.abs(audio[i]) > 1000) {
        loudInside++;
      }
    }
    assertTrue(loudInside > audio.length / frame * 100);
  }
}
