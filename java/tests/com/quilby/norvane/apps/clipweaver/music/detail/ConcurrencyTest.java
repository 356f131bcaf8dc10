package com.quilby.norvane.apps.clipweaver.music.detail;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;

import java.nio.ByteBuffer;
import java.util.ArrayList;
import java.util.List;
import java.util.concurrent.ExecutorService;
import java.util.concurrent.Executors;
import java.util.concurrent.Future;
import org.junit.jupiter.api.Test;

/** Analyses on many threads at once give exactly the single-threaded beats. */
class ConcurrencyTest {
  @Test
  void eightThreadsAnalysingDifferentTracks() throws Exception {
    int threads = 8;
    List<ByteBuffer> tracks = new ArrayList<>();
    List<float[]> expected = new ArrayList<>();
    for (int i = 0; i < threads; i++) {
      ByteBuffer pcm =
          TestTracks.direct(TestTracks.groove(6 + i, i % 2 == 0 ? 44100 : 22050, 1 + i % 2, 90 + 7 * i));
      tracks.add(pcm);
      expected.add(analyse(pcm, i));
    }
    ExecutorService pool = Executors.newFixedThreadPool(threads);
    try {
      List<Future<?>> runs = new ArrayList<>();
      for (int i = 0; i < threads; i++) {
        int track = i;
        runs.add(
            pool.submit(
                () -> {
                  for (int round = 0; round < 5; round++) {
                    assertArrayEquals(expected.get(track), analyse(tracks.get(track), track));
                  }
                }));
      }
      for (Future<?> run : runs) run.get();
    } finally {
      pool.shutdown();
    }
  }

  private static float[] analyse(ByteBuffer pcm, int track) {
    return new DefaultLocalMusicDetailExtractor()
        .calculateBeatsInSec(pcm, pcm.capacity(), track % 2 == 0 ? 44100 : 22050, 1 + track % 2);
  }
}
