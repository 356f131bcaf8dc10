package com.quilby.norvane.apps.clipweaver.music.detail;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import com.quilby.norvane.apps.clipweaver.testing.ChildJvm;
import java.lang.reflect.Method;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.Random;
import java.util.function.DoubleUnaryOperator;
import java.util.regex.Pattern;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;

class DefaultLocalMusicDetailExtractorTest {
  /** Kicks on every beat from time 0, snares on 2 and 4, hi-hats off the beat; channels equal. */
  static ByteBuffer groove(double seconds, int sampleRate, int channels, double bpm) {
    int frames = (int) Math.round(seconds * sampleRate);
    double[] mono = new double[frames];
    double beat = 60.0 / bpm;
    Random random = new Random(42);
    for (int b = 0; b * beat < seconds; b++) {
      double[] phase = {0};
      add(mono, sampleRate, b * beat, 0.25, t -> Math.exp(-t * 12)
          * Math.sin(phase[0] += 2 * Math.PI * (50 + 100 * Math.exp(-t * 30)) / sampleRate));
      if (b % 2 == 1) add(mono, sampleRate, b * beat, 0.12 * 4, noise(random, 0.12, 0.35));
      add(mono, sampleRate, (b + 0.5) * beat, 0.03 * 4, noise(random, 0.03, 0.12));
    }
    ByteBuffer pcm = ByteBuffer.allocateDirect(2 * frames * channels);
    pcm.order(ByteOrder.LITTLE_ENDIAN);
    for (int i = 0; i < frames; i++) {
      short s = (short) Math.max(-32768, Math.min(32767, Math.round(mono[i] * 20000)));
      for (int c = 0; c < channels; c++) pcm.putShort(s);
    }
    return pcm.clear();
  }

  // `seconds` of `sound`, a function of the time since `at`, mixed in from `at` on.
  private static void add(double[] out, int rate, double at, double seconds,
      DoubleUnaryOperator sound) {
    int start = (int) Math.round(at * rate);
    int length = (int) (seconds * rate);
    for (int i = 0; i < length && start + i < out.length; i++) {
      out[start + i] += sound.applyAsDouble((double) i / rate);
    }
  }

  private static DoubleUnaryOperator noise(Random random, double decaySeconds, double gain) {
    return t -> gain * (random.nextDouble() * 2 - 1) * Math.exp(-t / decaySeconds);
  }

  private static final DefaultLocalMusicDetailExtractor EXTRACTOR =
      new DefaultLocalMusicDetailExtractor();

  // Whatever the Java side passes, the analysis returns finite, rising beat times or none.
  private static float[] checked(float[] beats) {
    for (int i = 0; i < beats.length; i++) {
      assertTrue(Float.isFinite(beats[i]) && beats[i] >= 0, "beat " + beats[i]);
      if (i > 0) assertTrue(beats[i] > beats[i - 1]);
    }
    return beats;
  }

  private static float[] beatsOf(ByteBuffer pcm, int size, int rate, int channels) {
    return checked(EXTRACTOR.calculateBeatsInSec(pcm, size, rate, channels));
  }

  // The native log lines of one analysis of an 8 s groove ("..." stands for
  // the tracker's own), then its progress bytes and beat count. The stages'
  // own failures are the C++ tests'; these are the bridge's lines around them.
  @ParameterizedTest(name = "{0}")
  @CsvSource(delimiter = '#', value = {
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
    "range-refused-natively# Refused: tempo range NaN-180 BPM is not a range: both ends must be"
        + " numbers within 30-1200 BPM.# []# 0",
  })
  void eachOutcomeLogsItsStagesAndProgress(String scenario, String log, String progress,
      int beats) throws Exception {
    ChildJvm child = ChildJvm.run(Scenario.class, scenario);
    assertEquals(progress + "\n" + beats + "\n", child.stdout());
    String got = String.join("|", child.nativeTexts());
    assertTrue(got.matches(Pattern.quote(log).replace("...", "\\E.+\\Q")), got);
  }

  /** One analysis in a child JVM, whose native log on stderr the test reads. */
  public static final class Scenario {
    public static void main(String[] args) throws ReflectiveOperationException {
      String name = args[0];
      List<Integer> progress = new ArrayList<>();
      DefaultLocalMusicDetailExtractor extractor = new DefaultLocalMusicDetailExtractor(
          percent -> progress.add(percent) && name.equals("cancel-onset") && percent >= 33);
      ByteBuffer pcm = groove(8, 44100, 1, 120);
      int size = pcm.capacity();
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
        beats = extractor.calculateBeatsInSec(pcm, size, 44100, 1);
      }
      System.out.println(progress);
      System.out.println(beats.length);
    }
  }

  // Two equal channels give the mono beats. A range (0-0: none) holds the
  // tracker to grooves the default tracks at another metrical level.
  @ParameterizedTest
  @CsvSource({"2, 120, 0, 0", "1, 60, 50, 80", "1, 180, 150, 210"})
  void findsTheBeatsOfAGroove(int channels, double bpm, float min, float max) {
    ByteBuffer pcm = groove(30, 44100, channels, bpm);
    // The odd byte of a partial frame is left out.
    int size = pcm.capacity() - channels + 1;
    float[] beats = max == 0 ? beatsOf(pcm, size, 44100, channels)
        : checked(EXTRACTOR.calculateBeatsInSec(pcm, size, 44100, channels, min, max));
    // Periods are whole frames of 10 ms.
    assertEquals(60 / bpm, 60 / Tempo.precise(beats), 0.005);
    if (channels == 2) {
      ByteBuffer mono = groove(30, 44100, 1, bpm);
      assertArrayEquals(beatsOf(mono, mono.capacity(), 44100, 1), beats, "equal channels");
    }
  }

  @Test
  void anExceptionFromTheProgressMethodReachesTheCaller() {
    ByteBuffer pcm = groove(3, 44100, 1, 120);
    DefaultLocalMusicDetailExtractor extractor = new DefaultLocalMusicDetailExtractor(p -> {
      throw new IllegalStateException("listener failed at " + p);
    });
    assertEquals("listener failed at 0", assertThrows(IllegalStateException.class,
        () -> extractor.calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1)).getMessage());
  }

  // The start of a 4.5 s mono groove at 120 BPM in a direct buffer of `capacity` bytes,
  // passed with the size, rate and channel count given: the number of beats found.
  @ParameterizedTest(name = "capacity {0}, size {1}, rate {2}, channels {3}")
  @CsvSource({
    "400000, 0, 44100, 2, 0", "400000, -2147483648, 44100, 1, 0", "400000, 3, 44100, 2, 0",
    "400000, 2147483647, 44100, 2, 5", "400000, 400001, 8000, 3, 19", "400000, 4, 44100, 1, 0",
    "400000, 3528, 44100, 1, 0", "400000, 3530, 44100, 1, 0",
    "400000, 400000, 0, 1, 0", "400000, 400000, -44100, 1, 0", "400000, 400000, 1, 1, 0",
    "400000, 400000, 1000000000, 1, 0",
    "400000, 400000, 44100, -1, 0", "400000, 400000, 44100, 1000000000, 0",
    "400000, 400000, 44100, 2147483647, 0",
    "0, 1073741824, 44100, 1, 0", "1, 1073741824, 44100, 1, 0", "1000, 1073741824, 44100, 1, 0",
  })
  void hostileSizesRatesAndChannelCounts(int capacity, int size, int rate, int channels,
      int beats) {
    ByteBuffer track = groove(400000 / 2 / 44100.0, 44100, 1, 120);
    ByteBuffer pcm = ByteBuffer.allocateDirect(capacity);
    pcm.put(track.limit(capacity)).clear();
    assertEquals(beats, beatsOf(pcm, size, rate, channels).length);
  }

  // 4 s of samples from `from` to `to`, silence around them. A steady signal has no
  // onsets; only its start, where the detector's history is still empty, stands out as
  // a beat at 0. A lone burst 0.2 s in gets its one beat, on the burst's frame.
  @ParameterizedTest(name = "{0}")
  @CsvSource({"maximum, 32767, 32767, 0, 176400, 0", "minimum, -32768, -32768, 0, 176400, 0",
      "alternating, 32767, -32768, 0, 176400, 0", "dc, 1234, 1234, 0, 176400, 0",
      "burst, -20000, 20000, 8820, 9020, 0.17"})
  void steadySignalsAndALoneBurstGetOneBeat(String kind, short even, short odd, int from,
      int to, float beat) {
    ByteBuffer pcm = ByteBuffer.allocateDirect(4 * 88200).order(ByteOrder.LITTLE_ENDIAN);
    for (int i = from; i < to; i++) pcm.putShort(2 * i, i % 2 == 0 ? even : odd);
    assertArrayEquals(new float[] {beat}, beatsOf(pcm, pcm.capacity(), 44100, 1), kind);
  }

  // The native test reads the same table. Float beat times, as the extractor
  // returns them, cost some precision.
  @Test
  void preciseTempoOfTheSharedBeatLists() throws Exception {
    List<String> cases = sharedCases("precise_tempo_cases.tsv");
    assertTrue(cases.size() >= 15);
    for (String line : cases) {
      String[] f = line.split("\t", -1);
      double[] r = f[1].isEmpty() ? new double[0]
          : Arrays.stream(f[1].split(" ")).mapToDouble(Double::parseDouble).toArray();
      List<Double> times = new ArrayList<>();
      if (r.length > 0) times.add(r[0]);
      for (int i = 1; i < r.length; i += 2) {
        double from = times.get(times.size() - 1);
        for (int k = 1; k <= r[i]; k++) times.add(from + k * r[i + 1]);
      }
      Random random = new Random(7);
      float[] beats = new float[times.size()];
      for (int i = 0; i < beats.length; i++) {
        double t = times.get(i);
        if (f[2].equals("frames")) t = Math.round(t * 100) / 100.0;
        else t += random.nextGaussian() * Double.parseDouble(f[2]);
        beats[i] = (float) t;
      }
      assertEquals(Double.parseDouble(f[3]), Tempo.precise(beats),
          Math.max(Double.parseDouble(f[4]), 1e-3), f[0]);
    }
  }

  private static List<String> sharedCases(String name) throws Exception {
    Path cases = Path.of(System.getProperty("clipweaver.source"), "tests/jni/apm", name);
    return Files.readAllLines(cases).stream()
        .filter(line -> !line.isEmpty() && !line.startsWith("#")).toList();
  }

  // The native library reads the same table: both refuse the same ranges in
  // the same words, and the extractor refuses them before any work.
  @Test
  void badRangesAreRefusedAsByTheNativeLibrary() throws Exception {
    List<Integer> progress = new ArrayList<>();
    DefaultLocalMusicDetailExtractor extractor =
        new DefaultLocalMusicDetailExtractor(p -> !progress.add(p));
    ByteBuffer pcm = ByteBuffer.allocateDirect(88200);
    List<String> cases = sharedCases("tempo_range_cases.tsv");
    assertTrue(cases.size() >= 10);
    for (String line : cases) {
      String[] f = line.split("\t", -1);
      float min = Float.parseFloat(f[0]);
      float max = Float.parseFloat(f[1]);
      int rate = Integer.parseInt(f[2]);
      String error = f[3].isEmpty() ? null : f[3];
      assertEquals(error, TempoRange.error(min, max, rate), line);
      if (error != null) {
        assertEquals(error, assertThrows(IllegalArgumentException.class, () ->
            extractor.calculateBeatsInSec(pcm, pcm.capacity(), rate, 1, min, max)).getMessage());
      }
    }
    assertEquals(List.of(), progress);
  }
}
