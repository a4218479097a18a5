package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertNotEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.io.File;
import java.io.IOException;
import java.nio.ByteBuffer;
import java.nio.charset.StandardCharsets;
import org.junit.jupiter.api.Test;

/**
 * The library's fatal checks on buffer regions end the process, as they must (a wrong region would
 * read memory that is not the host's). Each case runs in a child JVM.
 */
class JniChecksTest {
  /** Child entry point: feeds one bad region to a decoder, which should end the process. */
  public static void main(String[] args) {
    NativeDecoder decoder = new NativeDecoder();
    decoder.nativeInitializeDsss(0, 8, false, false, 7, 0, 48000f, 16, 18500f, 4, 4, 4, false,
        0.75f, 5f, 2, 44100f, 1, 4f, false);
    ByteBuffer buffer =
        args[0].equals("heap") ? ByteBuffer.allocate(9) : ByteBuffer.allocateDirect(9);
    decoder.nativeProcessSamples(0, buffer, Integer.parseInt(args[1]), Integer.parseInt(args[2]));
    if (args[0].equals("release")) {
      decoder.nativeRelease(7); // Three slots at most here: id 7 is out of range.
    }
    System.exit(0); // Not reached when the check fires.
  }

  private static String runChild(String kind, int offset, int length)
      throws IOException, InterruptedException {
    Process child =
        ChildJvm.of(JniChecksTest.class, kind, Integer.toString(offset), Integer.toString(length))
            .redirectOutput(new File("/dev/null"))
            .start();
    String stderr = new String(child.getErrorStream().readAllBytes(), StandardCharsets.UTF_8);
    int status = child.waitFor();
    assertNotEquals(0, status, "the child should have been ended: " + stderr);
    return stderr;
  }

  @Test
  void badRegionsEndTheProcessWithTheirCheck() throws Exception {
    assertTrue(runChild("direct", 0, 3).contains("Check failed: length_bytes % 2 == 0"));
    assertTrue(runChild("direct", 2, 8)
                   .contains("Check failed: length_bytes + offset_bytes <= capacity_bytes"));
    assertTrue(runChild("direct", -2, 4).contains("Check failed: offset_bytes >= 0"));
    assertTrue(runChild("direct", 1, 2).contains("Check failed: offset_bytes % 2 == 0"));
    assertTrue(runChild("heap", 0, 2).contains("Check failed: direct_buffer != nullptr"));
  }

  @Test
  void outOfRangeIdsEndTheProcess() throws Exception {
    assertTrue(runChild("release", 0, 0).contains("Check failed"));
  }
}
