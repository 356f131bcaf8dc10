package com.quilby.norvane.apps.clipweaver.examples;

import com.quilby.norvane.apps.clipweaver.music.detail.DefaultLocalMusicDetailExtractor;
import java.io.IOException;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.nio.channels.FileChannel;
import java.nio.file.Path;
import java.nio.file.StandardOpenOption;

/**
 * Prints the beats of a 16-bit PCM WAV file through the native analysis, with a progress line
 * and a time limit after which the analysis is cancelled.
 *
 * <pre>java -Djava.library.path=build -cp clipweaver-native.jar:examples.jar \
 *     com.quilby.norvane.apps.clipweaver.examples.PrintBeats song.wav [seconds]</pre>
 */
public final class PrintBeats {
  private PrintBeats() {}

  public static void main(String[] args) throws IOException {
    if (args.length < 1) {
      System.err.println("usage: PrintBeats FILE.wav [time limit in seconds]");
      System.exit(2);
    }
    long limitNanos = (long) ((args.length > 1 ? Double.parseDouble(args[1]) : 60) * 1e9);
    ByteBuffer file = readAll(Path.of(args[0]));
    Wav wav = Wav.parse(file);
    if (wav == null) {
      System.err.println(args[0] + ": not a 16-bit PCM WAV file");
      System.exit(1);
    }
    long start = System.nanoTime();
    DefaultLocalMusicDetailExtractor extractor =
        new DefaultLocalMusicDetailExtractor(
            percent -> {
              System.err.print("\ranalysing " + percent + "%");
              return System.nanoTime() - start > limitNanos;
            });
    float[] beats =
        extractor.calculateBeatsInSec(wav.samples, wav.samples.capacity(), wav.sampleRate, wav.channels);
    System.err.println();
    System.out.println(beats.length + " beats");
    for (float beat : beats) System.out.printf("%.3f%n", beat);
  }

  private static ByteBuffer readAll(Path path) throws IOException {
    try (FileChannel channel = FileChannel.open(path, StandardOpenOption.READ)) {
      ByteBuffer buffer = ByteBuffer.allocateDirect((int) channel.size()).order(ByteOrder.LITTLE_ENDIAN);
      while (buffer.hasRemaining() && channel.read(buffer) >= 0) {}
      return buffer.flip();
    }
  }

  /** The format chunk's rate and channels, and the data chunk as a direct buffer. */
  private static final class Wav {
    int sampleRate;
    int channels;
    ByteBuffer samples;

    static Wav parse(ByteBuffer file) {
      if (file.remaining() < 12 || file.getInt(0) != 0x46464952 || file.getInt(8) != 0x45564157) {
        return null;
      }
      Wav wav = new Wav();
      int bits = 0;
      int position = 12;
      while (position + 8 <= file.limit()) {
        int id = file.getInt(position);
        int size = file.getInt(position + 4);
        int body = position + 8;
        if (size < 0 || body + size > file.limit()) size = file.limit() - body;
        if (id == 0x20746d66 && size >= 16) {
          if (file.getShort(body) != 1) return null;
          wav.channels = file.getShort(body + 2);
          wav.sampleRate = file.getInt(body + 4);
          bits = file.getShort(body + 14);
        } else if (id == 0x61746164) {
          wav.samples = file.duplicate().position(body).limit(body + size).slice();
        }
        position = body + size + (size & 1);
      }
      return bits == 16 && wav.samples != null ? wav : null;
    }
  }
}
