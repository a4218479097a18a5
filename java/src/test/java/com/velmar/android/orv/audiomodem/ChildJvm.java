package com.velmar.android.orv.audiomodem;

import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;

/**
 * Child JVMs for tests whose failure may end the process (a native fatal check): the child runs a
 * test class's {@code main} against the library built here, and only the child dies.
 */
final class ChildJvm {
  private ChildJvm() {}

  /** A process builder that runs {@code main.main(args)} in a new JVM. */
  static ProcessBuilder of(Class<?> main, String... args) {
    List<String> command = new ArrayList<>();
    command.add(ProcessHandle.current().info().command().orElse("java"));
    command.add("-Djava.library.path=" + System.getProperty("java.library.path"));
    command.add("-cp");
    // The test launcher loads the test classes itself; the build tells where they are.
    command.add(System.getProperty("vesk.test.classpath", System.getProperty("java.class.path")));
    command.add(main.getName());
    command.addAll(Arrays.asList(args));
    return new ProcessBuilder(command);
  }
}
