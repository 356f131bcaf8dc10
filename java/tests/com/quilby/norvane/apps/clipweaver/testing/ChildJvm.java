package com.quilby.norvane.apps.clipweaver.testing;

import java.io.File;
import java.io.IOException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.util.ArrayList;
import java.util.Arrays;
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

  public static ChildJvm run(Class<?> mainClass, String... args) throws IOException, InterruptedException {
    List<String> command = new ArrayList<>();
    command.add(System.getProperty("java.home") + File.separator + "bin" + File.separator + "java");
    command.add("-Djava.library.path=" + System.getProperty("java.library.path"));
    command.add("-cp");
    command.add(System.getProperty("clipweaver.classpath", System.getProperty("java.class.path")));
    command.add(mainClass.getName());
    command.addAll(Arrays.asList(args));
    // Files rather than pipes: a chatty child cannot block on a full pipe.
    File out = File.createTempFile("child", ".out");
    File err = File.createTempFile("child", ".err");
    try {
      Process process =
          new ProcessBuilder(command)
              .redirectInput(ProcessBuilder.Redirect.from(new File("/dev/null")))
              .redirectOutput(out)
              .redirectError(err)
              .start();
      if (!process.waitFor(300, TimeUnit.SECONDS)) {
        process.destroyForcibly();
        throw new IOException("child JVM timed out");
      }
      return new ChildJvm(
          process.exitValue(),
          Files.readString(out.toPath(), StandardCharsets.UTF_8),
          Files.readString(err.toPath(), StandardCharsets.UTF_8));
    } finally {
      out.delete();
      err.delete();
    }
  }

  /** The texts of the native log lines, without tag, file and line. */
  public List<String> nativeTexts() {
    List<String> texts = new ArrayList<>();
    for (String line : stderr.split("\n")) {
      if (!line.startsWith("native : ")) continue;
      int blank = line.indexOf(' ', "native : ".length());
      texts.add(line.substring(blank + 1));
    }
    return texts;
  }
}
