package com.quilby.norvane.apps.clipweaver.testing;

import java.io.File;
import java.io.IOException;
import java.nio.file.Files;
import java.util.ArrayList;
import java.util.List;
import java.util.concurrent.TimeUnit;

/**
 * Runs a main class in a fresh JVM, because the native log lines go to the
 * process's standard error, which a test cannot capture in its own JVM.
 */
public final class ChildJvm {
  public final int exitCode;
  public final String stdout;
  public final String stderr;

  private ChildJvm(int exitCode, String stdout, String stderr) {
    this.exitCode = exitCode;
    this.stdout = stdout;
    this.stderr = stderr;
  }

  public static ChildJvm run(Class<?> mainClass, String... args)
      throws IOException, InterruptedException {
    List<String> command = new ArrayList<>(List.of(
        System.getProperty("java.home") + "/bin/java",
        "-Djava.library.path=" + System.getProperty("java.library.path"),
        "-cp", System.getProperty("clipweaver.classpath", System.getProperty("java.class.path")),
        mainClass.getName()));
    command.addAll(List.of(args));
    // Files rather than pipes: a chatty child cannot block on a full pipe.
    File out = File.createTempFile("child", ".out");
    File err = File.createTempFile("child", ".err");
    try {
      Process process = new ProcessBuilder(command).redirectInput(new File("/dev/null"))
          .redirectOutput(out).redirectError(err).start();
      if (!process.waitFor(300, TimeUnit.SECONDS)) {
        process.destroyForcibly();
        throw new IOException("child JVM timed out");
      }
      return new ChildJvm(process.exitValue(), Files.readString(out.toPath()),
          Files.readString(err.toPath()));
    } finally {
      out.delete();
      err.delete();
    }
  }

  /** The texts of the native log lines, without tag, file and line. */
  public List<String> nativeTexts() {
    List<String> texts = new ArrayList<>();
    for (String line : stderr.split("\n")) {
      if (line.startsWith("native : ")) texts.add(line.substring(line.indexOf(' ', 9) + 1));
    }
    return texts;
  }
}
