package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.io.File;
import java.io.RandomAccessFile;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.nio.MappedByteBuffer;
import java.nio.channels.FileChannel;
import java.nio.file.Files;
import java.util.Arrays;
import java.util.List;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.function.Executable;

/**
 * What a careless caller can do through the real JVM: use objects after closing them, hand in
 * null, empty, odd, overflowing and huge inputs. Every such call is a clear exception or takes the
 * input as it is; none reaches a native check.
 */
class MisuseTest {
  private static final byte[] MESSAGE = {0x0F, 0x1E, 0x2D, 0x3C, 0x4B, 0x5A};
  private static final DsssConfig PRODUCT = DsssConfig.defaults();
  private static final DecoderOptions STEREO =
      DecoderOptions.builder().microphoneRate(48000).channels(2).build();

  private static void throwsWith(Class<? extends Throwable> type, String why, Executable call) {
    Throwable e = assertThrows(type, call);
    assertTrue(String.valueOf(e.getMessage()).contains(why), e.getMessage());
  }

  private static ByteBuffer direct(short[] samples) {
    ByteBuffer buffer =
        ByteBuffer.allocateDirect(2 * samples.length).order(ByteOrder.LITTLE_ENDIAN);
    buffer.asShortBuffer().put(samples);
    return buffer;
  }

  @Test
  void closedObjectsRefuseEveryCall() {
    TokenDecoder decoder = TokenDecoder.create(PRODUCT, STEREO);
    decoder.close();
    decoder.close();
    ByteBuffer buffer = ByteBuffer.allocateDirect(8);
    for (Executable call : new Executable[] {()
                                                 -> decoder.process(new short[4]),
             ()
                 -> decoder.process(new short[4], 0, 2),
             ()
                 -> decoder.process(buffer, 0, 8),
             decoder::tokens, decoder::broadcasterDetected, decoder::wipe,
             decoder::maxSafeInputSamples}) {
      throwsWith(IllegalStateException.class, "decoder is closed", call);
    }

    TokenEncoder encoder = TokenEncoder.create(PRODUCT);
    encoder.close();
    encoder.close();
    throwsWith(IllegalStateException.class, "encoder is closed", () -> encoder.encode(MESSAGE));

    TokenStream stream = TokenStream.create(TokenDecoder.create(PRODUCT, STEREO), token -> {});
    stream.close();
    stream.close();
    throwsWith(IllegalStateException.class, "stream is closed", () -> stream.feed(new short[4], 4));
    throwsWith(
        IllegalStateException.class, "stream is closed", () -> stream.feed(buffer.duplicate(), 4));
  }

  @Test
  void nullEmptyOddAndOverflowingRegions() {
    try (TokenDecoder decoder = TokenDecoder.create(PRODUCT, STEREO)) {
      throwsWith(NullPointerException.class, "samples", () -> decoder.process((short[]) null));
      throwsWith(
          NullPointerException.class, "samples", () -> decoder.process((short[]) null, 0, 0));
      throwsWith(
          NullPointerException.class, "directPcm", () -> decoder.process((ByteBuffer) null, 0, 0));
      ByteBuffer buffer = ByteBuffer.allocateDirect(64);
      // Odd byte counts, half frames, regions that overflow an int, negative and heap regions.
      throwsWith(
          IllegalArgumentException.class, "16-bit samples", () -> decoder.process(buffer, 0, 3));
      throwsWith(
          IllegalArgumentException.class, "16-bit samples", () -> decoder.process(buffer, 1, 4));
      throwsWith(IllegalArgumentException.class, "whole number of frames",
          () -> decoder.process(buffer, 0, 6));
      throwsWith(IllegalArgumentException.class, "whole number of frames",
          () -> decoder.process(new short[3]));
      throwsWith(IllegalArgumentException.class, "inside the buffer",
          () -> decoder.process(buffer, 32, Integer.MAX_VALUE - 1));
      throwsWith(IllegalArgumentException.class, "inside the buffer",
          () -> decoder.process(buffer, -2, 4));
      throwsWith(IllegalArgumentException.class, "direct",
          () -> decoder.process(ByteBuffer.allocate(8), 0, 8));
      throwsWith(IndexOutOfBoundsException.class, "offset 2, length 2147483646",
          () -> decoder.process(new short[8], 2, Integer.MAX_VALUE - 1));
      throwsWith(
          IndexOutOfBoundsException.class, "offset -2", () -> decoder.process(new short[8], -2, 2));
      // Empty input changes nothing: the token fed afterwards decodes.
      decoder.process(new short[0]);
      decoder.process(new short[8], 8, 0);
      decoder.process(buffer, 64, 0);
      decoder.process(TokenDecoderTest.transmission(PRODUCT, MESSAGE, 2, 21));
      List<byte[]> heard = decoder.tokens();
      assertFalse(heard.isEmpty());
      assertArrayEquals(MESSAGE, heard.get(0));
    }

    try (TokenEncoder encoder = TokenEncoder.create(PRODUCT)) {
      throwsWith(IllegalArgumentException.class, "6 bytes", () -> encoder.encode(null));
      EncodedToken token = encoder.encode(MESSAGE);
      throwsWith(IllegalArgumentException.class, "more than an array holds",
          () -> token.playback(Integer.MAX_VALUE));
    }
    try (TokenStream stream =
             TokenStream.create(TokenDecoder.create(PRODUCT, STEREO), token -> {})) {
      assertThrows(NullPointerException.class, () -> stream.feed((short[]) null, 0));
      throwsWith(IndexOutOfBoundsException.class, "exceeds", () -> stream.feed(new short[2], 3));
      throwsWith(IllegalArgumentException.class, "whole samples",
          () -> stream.feed(ByteBuffer.allocateDirect(4), 3));
    }
  }

  @Test
  void hugeInputIsTakenInAsAStream() {
    // Twenty seconds of silence before the token, in one call: far beyond the decoder's history,
    // so only streaming it in pieces keeps the token.
    short[] token = TokenDecoderTest.transmission(PRODUCT, MESSAGE, 2, 22);
    short[] huge = new short[2 * 20 * 48000 + token.length];
    System.arraycopy(token, 0, huge, huge.length - token.length, token.length);
    try (TokenDecoder decoder = TokenDecoder.create(PRODUCT, STEREO)) {
      decoder.process(huge);
      assertArrayEquals(MESSAGE, decoder.tokens().get(0));
      decoder.wipe();
      decoder.process(direct(huge), 0, 2 * huge.length);
      assertArrayEquals(MESSAGE, decoder.tokens().get(0));
    }
  }

  @Test
  void readOnlyMappedInputInTheListeningMode() throws Exception {
    // The listening mode mixes several channels down in place; a file mapped read-only must be
    // read, not written (writing would fault).
    short[] samples = TokenDecoderTest.transmission(PRODUCT, MESSAGE, 2, 23);
    File file = File.createTempFile("vesk-misuse", ".pcm");
    try {
      ByteBuffer pcm = ByteBuffer.allocate(2 * samples.length).order(ByteOrder.LITTLE_ENDIAN);
      pcm.asShortBuffer().put(samples);
      Files.write(file.toPath(), pcm.array());
      DecoderOptions listening =
          DecoderOptions.builder().microphoneRate(48000).channels(2).listeningMode(true).build();
      try (RandomAccessFile in = new RandomAccessFile(file, "r");
           TokenDecoder decoder = TokenDecoder.create(PRODUCT, listening)) {
        MappedByteBuffer mapped =
            in.getChannel().map(FileChannel.MapMode.READ_ONLY, 0, 2 * samples.length);
        decoder.process(mapped, 0, 2 * samples.length);
        assertArrayEquals(MESSAGE, decoder.tokens().get(0));
      }
      assertTrue(Arrays.equals(pcm.array(), Files.readAllBytes(file.toPath())));
    } finally {
      file.delete();
    }
  }

  @Test
  void theLargestHistoryReportsItsSafeSize() {
    // A DTMF history of 100 tokens of 64 channels at 384000 Hz: 1.2e9 samples, whose byte count
    // an int cannot hold: the answer stops at Integer.MAX_VALUE bytes.
    DtmfConfig dtmf = DtmfConfig.defaults();
    DecoderOptions largest = DecoderOptions.builder()
                                 .microphoneRate(384000)
                                 .channels(64)
                                 .bufferLengthTokens(100)
                                 .build();
    try (TokenDecoder decoder = TokenDecoder.create(dtmf, largest)) {
      assertTrue(100 * dtmf.tokenSeconds() * 384000 * 64 > Integer.MAX_VALUE / 2);
      assertEquals(Integer.MAX_VALUE / 2, decoder.maxSafeInputSamples());
    }
  }
}
