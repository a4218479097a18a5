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
 * The Android integration guide stays true to the code: its Java blocks compile, as Java 8, against
 * this library and stand-ins for the Android classes they use (so every Vesk call in them exists
 * with that signature), and the files its Gradle module names exist. The build passes the guide's
 * path and the class path.
 */
class AndroidGuideTest {
  private static final Pattern JAVA_BLOCK = Pattern.compile("(?s)```java\n(.*?)```");
  private static final Pattern PUBLIC_TYPE =
      Pattern.compile("(?m)^public (?:final |abstract )*(?:class|interface|enum) (\\w+)");
  // Paths into this repository, checked out as "vesk" beside the app's module.
  private static final Pattern REPOSITORY_PATH = Pattern.compile("'\\.\\./vesk/([^']+)'");

  private static Path guide() {
    String path = System.getProperty("vesk.android.guide");
    assertNotNull(path, "-Dvesk.android.guide names the guide");
    return Paths.get(path);
  }

  @Test
  void javaBlocksCompile(@TempDir Path dir) throws IOException {
    String classPath = System.getProperty("vesk.android.classpath");
    assertNotNull(classPath, "-Dvesk.android.classpath names the library and the stand-ins");
    String guide = new String(Files.readAllBytes(guide()), StandardCharsets.UTF_8);

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
    assertNotNull(javac, "the tests run on a JDK, which has a compiler");
    ByteArrayOutputStream diagnostics = new ByteArrayOutputStream();
    int status = javac.run(null, null, diagnostics, arguments.toArray(new String[0]));
    assertEquals(0, status, diagnostics.toString("UTF-8"));
  }

  @Test
  void theModuleNamesFilesThatExist() throws IOException {
    Path repository = guide().toAbsolutePath().getParent().getParent();
    String guide = new String(Files.readAllBytes(guide()), StandardCharsets.UTF_8);
    Matcher path = REPOSITORY_PATH.matcher(guide);
    int paths = 0;
    while (path.find()) {
      assertTrue(Files.exists(repository.resolve(path.group(1))), path.group());
      paths++;
    }
    // The consumer rules, the CMake project and the Java sources.
    assertEquals(3, paths);
  }
}
