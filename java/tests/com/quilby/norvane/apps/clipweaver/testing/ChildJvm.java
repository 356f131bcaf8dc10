package com.quilby.norvane.apps.clipweaver.testing;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.nio.file.Files;
import java.nio.file.Path;
import java.util.ArrayList;
import java.util.List;
import java.util.concurrent.TimeUnit;

/** A main class run in a fresh JVM, whose stderr, where native log lines go, a test can read. */
public record ChildJvm(String stdout, String stderr) {
  public static ChildJvm run(Class<?> mainClass, String... args) throws Exception {
    List<String> command = new ArrayList<>(List.of(
        System.getProperty("java.home") + "/bin/java",
        "-Djava.library.path=" + System.getProperty("java.library.path"),
        "-cp", System.getProperty("clipweaver.classpath", System.getProperty("java.class.path")),
        mainClass.getName()));
    command.addAll(List.of(args));
    // Files rather than pipes: a chatty child cannot block on a full pipe.
    Path out = Files.createTempFile("child", ".out");
    Path err = Files.createTempFile("child", ".err");
    Process process = new ProcessBuilder(command)
        .redirectOutput(out.toFile()).redirectError(err.toFile()).start();
    try {
      assertTrue(process.waitFor(300, TimeUnit.SECONDS), "child JVM timed out");
      ChildJvm child = new ChildJvm(Files.readString(out), Files.readString(err));
      assertEquals(0, process.exitValue(), child.stderr);
      return child;
    } finally {
      process.destroyForcibly();
      Files.delete(out);
      Files.delete(err);
    }
  }

  /** The texts of the native log lines, without tag, file and line. */
  public List<String> nativeTexts() {
    return stderr.lines().filter(line -> line.startsWith("native : "))
        .map(line -> line.substring(line.indexOf(' ', 9) + 1)).toList();
  }
}
