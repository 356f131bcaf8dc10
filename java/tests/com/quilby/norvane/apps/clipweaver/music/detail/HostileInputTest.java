package com.quilby.norvane.apps.clipweaver.music.detail;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotNull;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.nio.ByteBuffer;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;

/** Whatever the Java side passes, the analysis returns finite beats or none. */
class HostileInputTest {
  private static final DefaultLocalMusicDetailExtractor EXTRACTOR =
      new DefaultLocalMusicDetailExtractor();

  private static float[] analyse(ByteBuffer pcm, int size, int rate, int channels) {
    float[] beats = EXTRACTOR.calculateBeatsInSec(pcm, size, rate, channels);
    assertNotNull(beats);
    for (int i = 0; i < beats.length; i++) {
      assertTrue(Float.isFinite(beats[i]) && beats[i] >= 0, "beat " + beats[i]);
      if (i > 0) assertTrue(beats[i] > beats[i - 1]);
    }
    return beats;
  }

  // A 4.5 s groove in a direct buffer of `capacity` bytes (its start when
  // smaller), passed with the size, rate and channel count given.
  @ParameterizedTest(name = "capacity {0}, size {1}, rate {2}, channels {3}")
  @CsvSource({
    "400000, -1, 44100, 2, none",
    "400000, 0, 44100, 2, none",
    "400000, 2147483647, 44100, 2, any",
    "400000, -2147483648, 44100, 1, none",
    "400000, 3, 44100, 2, none",
    "400000, 2, 44100, 1, none",
    "400000, 4, 44100, 1, any",
    "400000, 3528, 44100, 1, any",
    "400000, 3530, 44100, 1, any",
    "400000, 400000, 0, 1, none",
    "400000, 400000, -44100, 1, none",
    "400000, 400000, 1, 1, none",
    "400000, 400000, 1000000000, 1, any",
    "400000, 400000, 44100, -1, none",
    "400000, 400000, 44100, 1000000000, none",
    "400000, 400000, 44100, 2147483647, none",
    "400000, 400001, 8000, 3, any",
    "0, 1073741824, 44100, 1, none",
    "1, 1073741824, 44100, 1, none",
    "1000, 1073741824, 44100, 1, none",
  })
  void sizesRatesAndChannelCounts(int capacity, int size, int rate, int channels, String beats) {
    ByteBuffer groove = TestTracks.direct(TestTracks.groove(400000 / 2 / 44100.0, 44100, 1, 120));
    ByteBuffer pcm = ByteBuffer.allocateDirect(capacity);
    pcm.put(groove.limit(capacity)).clear();
    float[] found = analyse(pcm, size, rate, channels);
    if (beats.equals("none")) assertEquals(0, found.length);
  }

  // A steady signal has no onsets; only its start, where the detector's
  // history is still empty, may stand out as a single beat at 0.
  @ParameterizedTest(name = "{0}")
  @CsvSource({"zeros, 0, 0", "maximum, 32767, 32767", "minimum, -32768, -32768",
      "alternating, 32767, -32768", "dc, 1234, 1234"})
  void steadySignalsGiveAtMostTheStartingBeat(String kind, short even, short odd) {
    short[] pcm = new short[44100 * 4];
    for (int i = 0; i < pcm.length; i++) pcm[i] = i % 2 == 0 ? even : odd;
    ByteBuffer buffer = TestTracks.direct(pcm);
    float[] beats = analyse(buffer, buffer.capacity(), 44100, 1);
    assertTrue(beats.length == 0 || (beats.length == 1 && beats[0] == 0.0f), kind);
    if (even == 0) assertEquals(0, beats.length);
  }
}
