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
  private static float[] steady(int count, double period, double start) {
    float[] beats = new float[count];
    for (int i = 0; i < count; i++) beats[i] = (float) (start + i * period);
    return beats;
  }

  private static float[] without(float[] beats, int index) {
    float[] out = new float[beats.length - 1];
    for (int i = 0, j = 0; i < beats.length; i++) if (i != index) out[j++] = beats[i];
    return out;
  }

  private static float[] jittered(int count, double period, double jitter) {
    Random random = new Random(7);
    float[] beats = steady(count, period, 0.3);
    for (int i = 0; i < count; i++) beats[i] += (float) (random.nextGaussian() * jitter);
    return beats;
  }

  private static float[] tempoChange() {
    float[] slow = steady(40, 0.6, 0.3);
    float[] fast = steady(60, 60.0 / 130, slow[39] + 60.0 / 130);
    float[] beats = new float[100];
    System.arraycopy(slow, 0, beats, 0, 40);
    System.arraycopy(fast, 0, beats, 40, 60);
    return beats;
  }

  // Eight beats at 0.56 s before the tracker locks on 0.6 s.
  private static float[] settling() {
    float[] beats = new float[48];
    for (int i = 0; i < 48; i++) beats[i] = (float) (i < 8 ? i * 0.56 : 7 * 0.56 + (i - 7) * 0.6);
    return beats;
  }

  private record Row(String name, float[] beats, double bpm, double tolerance) {}

  // Float beat times, as the extractor returns them, cost some precision.
  @Test
  void preciseTempoOfBeatLists() {
    for (Row row :
        List.of(
            new Row("steady", steady(30, 0.5, 0.3), 120, 1e-3),
            new Row("jittered by 10 ms", jittered(80, 0.5, 0.01), 120, 0.3),
            new Row("one beat missing", without(steady(30, 0.5, 0.3), 12), 120, 1e-3),
            new Row("tempo change: the longer part", tempoChange(), 130, 1e-3),
            new Row("three beats", steady(3, 0.4, 0.3), 150, 1e-3),
            new Row("settling at 107 BPM first", settling(), 100, 0.03),
            new Row("two beats", steady(2, 0.5, 0.3), Double.NaN, 0),
            new Row("nothing steady", new float[] {0, 0.5f, 1.3f, 1.6f, 2.7f, 3f}, Double.NaN, 0))) {
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
