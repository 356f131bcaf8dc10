package com.quilby.norvane.apps.clipweaver.music.detail;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import com.quilby.norvane.apps.clipweaver.testing.ChildJvm;
import java.lang.reflect.Method;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;

class DefaultLocalMusicDetailExtractorTest {
  private static final DefaultLocalMusicDetailExtractor EXTRACTOR =
      new DefaultLocalMusicDetailExtractor();

  private static float[] beatsOf(ByteBuffer pcm, int rate, int channels) {
    return EXTRACTOR.calculateBeatsInSec(pcm, pcm.capacity(), rate, channels);
  }

  // The native log of one analysis of an 8 s groove ("..." stands for the
  // tracker's own lines), then its progress bytes and beat count.
  @ParameterizedTest(name = "{0}")
  @CsvSource(delimiter = '#', value = {
    "channels-zero# Channels are less than one!|Failed to retrieve beats from APM!"
        + "|Gets 0 beats from APM!# []# 0",
    "one-byte# Input samples size: 0|Failed to retrieve beats from APM!"
        + "|Gets 0 beats from APM!# []# 0",
    "shorter-than-window# Input samples size: 100|Empty input for onset detector! "
        + "|Onset process failed!|Failed to retrieve beats from APM!|Gets 0 beats from APM!# []# 0",
    "cancel-first# Input samples size: 352800|Failed to compute spectrogram!"
        + "|Spectrogram process failed!|Failed to retrieve beats from APM!"
        + "|Gets 0 beats from APM!# [0]# 0",
    "cancel-onset# Input samples size: 352800|Onset process failed!"
        + "|Failed to retrieve beats from APM!|Gets 0 beats from APM!"
        + "# [0, 4, 8, 12, 16, 20, 24, 28, 33]# 0",
    "heap-buffer# The PCM buffer is not a direct buffer: nothing analysed.# []# 0",
    "silence# Input samples size: 44100|Preprocess done. apm input size: 97"
        + "|No onsets above the running median (silent or steady input): no beats to track."
        + "|Gets 0 beats from APM!# [0, 33]# 0",
    "oversized# PCM size 706600 bytes exceeds the buffer capacity of 705600 bytes; analysing"
        + " the capacity.|Input samples size: 352800|Preprocess done. apm input size: 797|..."
        + "|Estimated BPM = 120|Gets 16 beats from APM!"
        + "# [0, 4, 8, 12, 16, 20, 24, 28, 33, 37, 41, 45, 49, 53, 57, 61, 66, 86]# 16",
    "success# Input samples size: 352800|Preprocess done. apm input size: 797|..."
        + "|Estimated BPM = 120|Gets 16 beats from APM!"
        + "# [0, 4, 8, 12, 16, 20, 24, 28, 33, 37, 41, 45, 49, 53, 57, 61, 66, 86]# 16",
    "range-refused-natively# Refused: tempo range NaN-180 BPM is not a range: both ends must be"
        + " numbers within 30-1200 BPM.# []# 0",
  })
  void eachOutcomeLogsItsStagesAndProgress(String scenario, String log, String progress,
      int beats) throws Exception {
    ChildJvm child = ChildJvm.run(Scenario.class, scenario);
    assertEquals(0, child.exitCode, child.stderr);
    assertEquals(progress + "\n" + beats + "\n", child.stdout);
    List<String> expected = Arrays.asList(log.split("\\|"));
    List<String> got = child.nativeTexts();
    int gap = expected.indexOf("...");
    if (gap >= 0) {
      int tail = expected.size() - gap - 1;
      assertTrue(got.size() > gap + tail, got.toString());
      got = new ArrayList<>(got);
      got.subList(gap, got.size() - tail).clear();
      got.add(gap, "...");
    }
    assertEquals(expected, got);
  }

  /** One analysis in a child JVM, whose native log on stderr the test reads. */
  public static final class Scenario {
    public static void main(String[] args) throws ReflectiveOperationException {
      String name = args[0];
      List<Integer> progress = new ArrayList<>();
      int cancelAt = name.equals("cancel-first") ? 0 : name.equals("cancel-onset") ? 33 : -1;
      DefaultLocalMusicDetailExtractor extractor =
          new DefaultLocalMusicDetailExtractor(
              percent -> progress.add(percent) && cancelAt >= 0 && percent >= cancelAt);
      ByteBuffer pcm = TestTracks.direct(TestTracks.groove(8, 44100, 1, 120));
      int size = pcm.capacity();
      int channels = name.equals("channels-zero") ? 0 : 1;
      if (name.equals("one-byte")) size = 1;
      if (name.equals("shorter-than-window")) size = 200;
      if (name.equals("oversized")) size += 1000;
      if (name.equals("silence")) pcm = ByteBuffer.allocateDirect(size = 88200);
      if (name.equals("heap-buffer")) pcm = ByteBuffer.allocate(size = 88200);
      float[] beats;
      if (name.equals("range-refused-natively")) {
        // The native entry behind the range overload, reached past its Java check.
        Method entry =
            DefaultLocalMusicDetailExtractor.class.getDeclaredMethod("calculateBeatsInTempoRange",
                ByteBuffer.class, int.class, int.class, int.class, float.class, float.class);
        entry.setAccessible(true);
        beats = (float[]) entry.invoke(extractor, pcm, size, 44100, 1, Float.NaN, 180f);
      } else {
        beats = extractor.calculateBeatsInSec(pcm, size, 44100, channels);
      }
      System.out.println(progress);
      System.out.println(beats.length);
    }
  }

  // Beat times count frames at the whole number of frames per second: at
  // 22050 Hz a step of 221 samples makes 99.77 frames a second, counted as
  // 99, which stretches every time by that ratio. A range (0-0: none) holds
  // the tracker to grooves the default tracks at another metrical level.
  @ParameterizedTest
  @CsvSource({
    "44100, 2, 441, 120, 0, 0", "48000, 1, 480, 120, 0, 0", "22050, 1, 221, 120, 0, 0",
    "44100, 1, 441, 60, 50, 80", "44100, 1, 441, 180, 150, 210",
  })
  void findsTheBeatsOfAGroove(int rate, int channels, int step, double bpm, float min, float max) {
    ByteBuffer pcm = TestTracks.direct(TestTracks.groove(30, rate, channels, bpm));
    float[] beats = max == 0 ? beatsOf(pcm, rate, channels)
        : EXTRACTOR.calculateBeatsInSec(pcm, pcm.capacity(), rate, channels, min, max);
    double frameRate = (double) rate / step;
    double expected = 60 / bpm * frameRate / Math.floor(frameRate);
    // Periods are whole frames.
    assertEquals(expected, TestTracks.medianInterval(beats), 0.5 / Math.floor(frameRate));
    for (int i = 1; i < beats.length; i++) assertTrue(beats[i] > beats[i - 1]);
  }

  // The tracker's own range, 75 to 1200 BPM, is its default set-up.
  @Test
  void theDefaultRangeGivesTheFourArgumentBeatsAndProgress() {
    ByteBuffer pcm = TestTracks.direct(TestTracks.groove(12, 44100, 1, 120));
    List<Integer> plain = new ArrayList<>();
    List<Integer> ranged = new ArrayList<>();
    float[] expected = new DefaultLocalMusicDetailExtractor(p -> !plain.add(p))
        .calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1);
    float[] beats = new DefaultLocalMusicDetailExtractor(p -> !ranged.add(p))
        .calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1, 75, 1200);
    assertTrue(expected.length > 15);
    assertArrayEquals(expected, beats);
    assertEquals(plain, ranged);
    assertEquals(0, new DefaultLocalMusicDetailExtractor(p -> true)
        .calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1, 75, 1200).length);
  }

  // A lone burst 0.2 s into 0.4 s of silence: one beat, on the burst's frame.
  @Test
  void aLoneBurstGetsItsOneBeat() {
    ByteBuffer pcm = ByteBuffer.allocateDirect(2 * 17640).order(ByteOrder.LITTLE_ENDIAN);
    for (int i = 0; i < 200; i++) pcm.putShort(2 * (8820 + i), (short) (i % 2 == 1 ? 20000 : -20000));
    assertArrayEquals(new float[] {0.17f}, beatsOf(pcm, 44100, 1));
  }

  @Test
  void equalStereoChannelsGiveTheBeatsOfOneAndTrailingBytesAreIgnored() {
    ByteBuffer stereoPcm = TestTracks.direct(TestTracks.groove(12, 44100, 2, 100));
    float[] fromMono = beatsOf(TestTracks.direct(TestTracks.groove(12, 44100, 1, 100)), 44100, 1);
    assertTrue(fromMono.length > 10);
    assertArrayEquals(fromMono, beatsOf(stereoPcm, 44100, 2));
    assertArrayEquals(fromMono,
        EXTRACTOR.calculateBeatsInSec(stereoPcm, stereoPcm.capacity() - 1, 44100, 2));
  }

  @Test
  void anExceptionFromTheProgressMethodReachesTheCaller() {
    ByteBuffer pcm = TestTracks.direct(TestTracks.groove(3, 44100, 1, 120));
    DefaultLocalMusicDetailExtractor extractor = new DefaultLocalMusicDetailExtractor(p -> {
      throw new IllegalStateException("listener failed at " + p);
    });
    assertEquals("listener failed at 0", assertThrows(IllegalStateException.class,
        () -> extractor.calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1)).getMessage());
  }
}
