package com.quilby.norvane.apps.clipweaver.music.detail;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.nio.ByteBuffer;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.ArrayList;
import java.util.List;
import java.util.Random;
import org.junit.jupiter.api.Test;

class TempoTest {
  // Beats from `start` on, in runs of (count, period), each run following the last beat.
  private static float[] beats(double start, double... runs) {
    List<Double> times = new ArrayList<>(List.of(start));
    for (int r = 0; r < runs.length; r += 2) {
      double from = times.get(times.size() - 1);
      for (int i = 1; i <= runs[r]; i++) times.add(from + i * runs[r + 1]);
    }
    float[] out = new float[times.size()];
    for (int i = 0; i < out.length; i++) out[i] = (float) (double) times.get(i);
    return out;
  }

  private static float[] jittered(float[] beats, double jitter) {
    Random random = new Random(7);
    for (int i = 0; i < beats.length; i++) beats[i] += (float) (random.nextGaussian() * jitter);
    return beats;
  }

  private record Row(String name, float[] beats, double bpm, double tolerance) {}

  // Float beat times, as the extractor returns them, cost some precision.
  @Test
  void preciseTempoOfBeatLists() {
    for (Row row :
        List.of(
            new Row("steady", beats(0.3, 29, 0.5), 120, 1e-3),
            new Row("jittered by 10 ms", jittered(beats(0.3, 79, 0.5), 0.01), 120, 0.3),
            new Row("one beat missing", beats(0.3, 11, 0.5, 1, 1.0, 16, 0.5), 120, 1e-3),
            new Row("longer of two tempi", beats(0.3, 39, 0.6, 60, 60 / 130.0), 130, 1e-3),
            new Row("three beats", beats(0.3, 2, 0.4), 150, 1e-3),
            new Row("settling at 107 BPM first", beats(0, 7, 0.56, 40, 0.6), 100, 0.03),
            new Row("two beats", beats(0.3, 1, 0.5), Double.NaN, 0),
            new Row("nothing steady", new float[] {0, 0.5f, 1.3f, 1.6f, 2.7f, 3f}, Double.NaN,
                0))) {
      assertEquals(row.bpm, Tempo.precise(row.beats), row.tolerance, row.name);
    }
  }

  // The native library reads the same table: both refuse the same ranges in
  // the same words, and the extractor refuses them before any work.
  @Test
  void badRangesAreRefusedAsByTheNativeLibrary() throws Exception {
    Path cases =
        Path.of(System.getProperty("clipweaver.source"), "tests/jni/apm/tempo_range_cases.tsv");
    List<Integer> progress = new ArrayList<>();
    DefaultLocalMusicDetailExtractor extractor =
        new DefaultLocalMusicDetailExtractor(p -> !progress.add(p));
    ByteBuffer pcm = ByteBuffer.allocateDirect(88200);
    int rows = 0;
    for (String line : Files.readAllLines(cases)) {
      if (line.isEmpty() || line.startsWith("#")) continue;
      String[] f = line.split("\t", -1);
      float min = Float.parseFloat(f[0]);
      float max = Float.parseFloat(f[1]);
      int rate = Integer.parseInt(f[2]);
      assertEquals(f[3].isEmpty() ? null : f[3], TempoRange.error(min, max, rate), line);
      if (!f[3].isEmpty()) {
        IllegalArgumentException thrown =
            assertThrows(
                IllegalArgumentException.class,
                () -> extractor.calculateBeatsInSec(pcm, pcm.capacity(), rate, 1, min, max));
        assertEquals(f[3], thrown.getMessage());
      }
      rows++;
    }
    assertTrue(rows >= 10);
    assertEquals(List.of(), progress);
  }
}
