package com.quilby.norvane.apps.clipweaver.music.detail;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import com.quilby.norvane.apps.clipweaver.testing.ChildJvm;
import java.nio.ByteBuffer;
import java.util.ArrayList;
import java.util.List;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;

class DefaultLocalMusicDetailExtractorTest {
  private static final String FAILED = "Failed to retrieve beats from APM!";
  private static final String NONE = "Gets 0 beats from APM!";

  private static List<String> logOf(String scenario) throws Exception {
    ChildJvm child = ChildJvm.run(BeatScenario.class, scenario);
    assertEquals(0, child.exitCode, child.stderr);
    return child.nativeTexts();
  }

  @Test
  void failuresLogTheirStageAndReturnNothing() throws Exception {
    assertEquals(
        List.of("Channels are less than one!", FAILED, NONE), logOf("channels-zero"));
    assertEquals(List.of("Input samples size: 0", FAILED, NONE), logOf("one-byte"));
    assertEquals(
        List.of(
            "Input samples size: 100",
            "Empty input for onset detector! ",
            "Onset process failed!",
            FAILED,
            NONE),
        logOf("shorter-than-window"));
    assertEquals(
        List.of(
            "Input samples size: 352800",
            "Failed to compute spectrogram!",
            "Spectrogram process failed!",
            FAILED,
            NONE),
        logOf("cancel-first"));
  }

  @Test
  void cancellingAtTheOnsetStageStopsAfterTheSpectrogram() throws Exception {
    ChildJvm child = ChildJvm.run(BeatScenario.class, "cancel-onset");
    List<String> log = child.nativeTexts();
    assertEquals(
        List.of("Input samples size: 352800", "Onset process failed!", FAILED, NONE), log);
    String[] lines = child.stdout.split("\n");
    assertEquals("0", lines[1]);
    List<Integer> bytes = parseList(lines[0]);
    assertEquals(33, bytes.get(bytes.size() - 1));
    for (int b : bytes.subList(0, bytes.size() - 1)) assertTrue(b >= 0 && b <= 32, lines[0]);
  }

  @Test
  void badBuffersAndSilenceEndWithoutBeats() throws Exception {
    List<String> heap = logOf("heap-buffer");
    assertEquals(1, heap.size(), heap.toString());

    List<String> silence = logOf("silence");
    assertEquals("Input samples size: 44100", silence.get(0));
    assertEquals(NONE, silence.get(silence.size() - 1));
    assertTrue(silence.stream().noneMatch(l -> l.contains("Estimated BPM")), silence.toString());

    List<String> oversized = logOf("oversized");
    assertTrue(oversized.get(0).contains("capacity"), oversized.toString());
    assertEquals("Input samples size: 352800", oversized.get(1));
  }

  @Test
  void successLogsTheInputAndTheBeatCount() throws Exception {
    ChildJvm child = ChildJvm.run(BeatScenario.class, "success");
    List<String> log = child.nativeTexts();
    int beats = Integer.parseInt(child.stdout.split("\n")[1]);
    assertTrue(beats > 10, child.stdout);
    assertEquals("Gets " + beats + " beats from APM!", log.get(log.size() - 1));
    assertTrue(log.contains("Preprocess done. apm input size: 797"), log.toString());
  }

  // Beat times count frames at the whole number of frames per second: at
  // 22050 Hz a step of 221 samples makes 99.77 frames a second, counted as
  // 99, which stretches every time by that ratio.
  @ParameterizedTest
  @CsvSource({"44100, 2, 441", "48000, 1, 480", "22050, 1, 221"})
  void findsTheBeatsOfA120BpmGroove(int sampleRate, int channels, int step) {
    DefaultLocalMusicDetailExtractor extractor = new DefaultLocalMusicDetailExtractor();
    ByteBuffer pcm = TestTracks.direct(TestTracks.groove(30, sampleRate, channels, 120));
    float[] beats = extractor.calculateBeatsInSec(pcm, pcm.capacity(), sampleRate, channels);

    double frameRate = (double) sampleRate / step;
    double expected = 0.5 * frameRate / Math.floor(frameRate);
    assertEquals(expected, TestTracks.medianInterval(beats), 0.01 * expected);
    for (int i = 1; i < beats.length; i++) assertTrue(beats[i] > beats[i - 1]);
  }

  // The tracker's own range, 75 to 1200 BPM, is its default set-up.
  @Test
  void theDefaultRangeGivesTheFourArgumentBeatsAndProgress() {
    ByteBuffer pcm = TestTracks.direct(TestTracks.groove(12, 44100, 1, 120));
    List<Integer> plain = new ArrayList<>();
    List<Integer> ranged = new ArrayList<>();
    float[] expected =
        new DefaultLocalMusicDetailExtractor(p -> !plain.add(p))
            .calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1);
    float[] beats =
        new DefaultLocalMusicDetailExtractor(p -> !ranged.add(p))
            .calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1, 75, 1200);
    assertTrue(expected.length > 15);
    assertArrayEquals(expected, beats);
    assertEquals(plain, ranged);
    assertEquals(0, ranged.get(0));
    assertTrue(ranged.contains(33) && ranged.contains(66), ranged.toString());
    for (int i = 1; i < ranged.size(); i++) {
      assertTrue(ranged.get(i) >= ranged.get(i - 1), ranged.toString());
    }
    assertTrue(ranged.get(ranged.size() - 1) <= 98);

    DefaultLocalMusicDetailExtractor cancelling = new DefaultLocalMusicDetailExtractor(p -> true);
    assertEquals(0, cancelling.calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1, 75, 1200).length);
  }

  // Grooves the default tracks at another metrical level.
  @ParameterizedTest
  @CsvSource({"60, 50, 80", "180, 150, 210"})
  void aRangeHoldsTheTrackerToItsTempo(double bpm, float minBpm, float maxBpm) {
    ByteBuffer pcm = TestTracks.direct(TestTracks.groove(30, 44100, 1, bpm));
    DefaultLocalMusicDetailExtractor extractor = new DefaultLocalMusicDetailExtractor();
    double byDefault = Tempo.precise(extractor.calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1));
    double inRange =
        Tempo.precise(extractor.calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1, minBpm, maxBpm));
    assertTrue(Math.abs(byDefault / bpm - 1) > 0.2, "default " + byDefault);
    assertEquals(bpm, inRange, 0.005 * bpm);
  }

  @Test
  void aBadRangeReachingTheNativeEntryLogsOneErrorAndReturnsNothing() throws Exception {
    ChildJvm child = ChildJvm.run(BeatScenario.class, "range-refused-natively");
    assertEquals(
        List.of(
            "Refused: tempo range NaN-180 BPM is not a range: both ends must be numbers within"
                + " 30-1200 BPM."),
        child.nativeTexts());
    assertEquals("[]\n0\n", child.stdout);
  }

  @Test
  void equalStereoChannelsGiveTheBeatsOfOneAndTrailingBytesAreIgnored() {
    DefaultLocalMusicDetailExtractor extractor = new DefaultLocalMusicDetailExtractor();
    short[] stereo = TestTracks.groove(12, 44100, 2, 100);
    ByteBuffer stereoPcm = TestTracks.direct(stereo);
    ByteBuffer monoPcm = TestTracks.direct(TestTracks.firstChannel(stereo, 2));
    float[] fromStereo =
        extractor.calculateBeatsInSec(stereoPcm, stereoPcm.capacity(), 44100, 2);
    float[] fromMono = extractor.calculateBeatsInSec(monoPcm, monoPcm.capacity(), 44100, 1);
    float[] withPartialFrame =
        extractor.calculateBeatsInSec(stereoPcm, stereoPcm.capacity() - 1, 44100, 2);
    assertTrue(fromMono.length > 10);
    assertArrayEquals(fromMono, fromStereo);
    assertArrayEquals(fromMono, withPartialFrame);
  }

  @Test
  void anExceptionFromTheProgressMethodReachesTheCaller() {
    ByteBuffer pcm = TestTracks.direct(TestTracks.groove(3, 44100, 1, 120));
    DefaultLocalMusicDetailExtractor extractor =
        new DefaultLocalMusicDetailExtractor(
            p -> {
              throw new IllegalStateException("listener failed at " + p);
            });
    IllegalStateException thrown =
        assertThrows(
            IllegalStateException.class,
            () -> extractor.calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1));
    assertEquals("listener failed at 0", thrown.getMessage());
  }

  private static List<Integer> parseList(String text) {
    List<Integer> values = new ArrayList<>();
    for (String part : text.replaceAll("[\\[\\] ]", "").split(",")) {
      if (!part.isEmpty()) values.add(Integer.parseInt(part));
    }
    return values;
  }
}
