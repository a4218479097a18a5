package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotNull;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.io.ByteArrayOutputStream;
import java.io.IOException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import javax.tools.JavaCompiler;
import javax.tools.ToolProvider;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.io.TempDir;

/**
 * The Java blocks of the Android integration guide compile, as Java 8, against this library and
 * stand-ins for the Android classes they use: every Vesk call in them exists with that signature.
 * The build passes the guide's path and the class path.
 */
class AndroidGuideTest {
  private static final Pattern JAVA_BLOCK = Pattern.compile("(?s)```java\n(.*?)```");
  private static final Pattern PUBLIC_TYPE =
      Pattern.compile("(?m)^public (?:final |abstract )*(?:class|interface|enum) (\\w+)");

  @Test
  void javaBlocksCompile(@TempDir Path dir) throws IOException {
    String guidePath = System.getProperty("vesk.android.guide");
    String classPath = System.getProperty("vesk.android.classpath");
    assertNotNull(guidePath, "-Dvesk.android.guide names the guide");
    assertNotNull(classPath, "-Dvesk.android.classpath names the library and the stand-ins");
    String guide = new String(Files.readAllBytes(Paths.get(guidePath)), StandardCharsets.UTF_8);

    List<String> sources = new ArrayList<>();
    Matcher block = JAVA_BLOCK.matcher(guide);
    while (block.find()) {
      Matcher type = PUBLIC_TYPE.matcher(block.group(1));
      assertTrue(type.find(), "a Java block without a public class:\n" + block.group(1));
      Path source = dir.resolve(type.group(1) + ".java");
      Files.write(source, block.group(1).getBytes(StandardCharsets.UTF_8));
      sources.add(source.toString());
    }
    // The recorder, the listener, the player and the modem choices.
    assertEquals(4, sources.size(), "Java blocks in the guide");

    List<String> arguments = new ArrayList<>(Arrays.asList("--release", "8", "-Xlint:all",
        "-Werror", "-proc:none", "-classpath", classPath, "-d", dir.toString()));
    arguments.addAll(sources);
    JavaCompiler javac = ToolProvider.getSystemJavaCompiler();
    ByteArrayOutputStream diagnostics = new ByteArrayOutputStream();
    int status = javac.run(null, null, diagnostics, arguments.toArray(new String[0]));
    assertEquals(0, status, diagnostics.toString("UTF-8"));
  }
}
