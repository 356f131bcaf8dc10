package com.quilby.norvane.apps.clipweaver.media.audio;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotEquals;
import static org.junit.jupiter.api.Assertions.assertNull;
import static org.junit.jupiter.api.Assertions.assertThrows;

import com.quilby.norvane.apps.clipweaver.testing.ChildJvm;
import java.lang.ref.WeakReference;
import java.lang.reflect.Field;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.function.Executable;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;

public class AudioResamplerTest {
  private static final byte FILL = 0x55;
  private static final short FILL_SAMPLE = 0x5555;

  private static ByteBuffer context() {
    return ByteBuffer.allocateDirect(16).order(ByteOrder.nativeOrder());
  }

  private static ByteBuffer created(int channels, int rate, boolean stereoOutput) {
    ByteBuffer context = context();
    AudioResampler.createNativeResampler(context, 2, channels, rate, stereoOutput);
    return context;
  }

  private static byte[] pcm(int... samples) {
    ByteBuffer bytes = ByteBuffer.allocate(2 * samples.length).order(ByteOrder.nativeOrder());
    for (int s : samples) bytes.putShort((short) s);
    return bytes.array();
  }

  private static short[] samples(byte[] bytes) {
    short[] samples = new short[bytes.length / 2];
    ByteBuffer.wrap(bytes).order(ByteOrder.nativeOrder()).asShortBuffer().get(samples);
    return samples;
  }

  private static ByteBuffer direct(byte[] bytes) {
    ByteBuffer buffer = ByteBuffer.allocateDirect(bytes.length);
    buffer.put(bytes).clear();
    return buffer;
  }

  private static byte[] filled(int size) {
    byte[] bytes = new byte[size];
    Arrays.fill(bytes, FILL);
    return bytes;
  }

  @Test
  void contextHoldsInstanceChannelCountAndStereoFlag() {
    assertEquals(16, AudioResampler.getNativeResamplerContextSize());
    for (int channels = 1; channels <= 2; channels++) {
      ByteBuffer context = context();
      for (int i = 12; i < 16; i++) context.put(i, (byte) 0x5a);
      AudioResampler.createNativeResampler(context, 2, channels, 48000, channels == 1);
      assertNotEquals(0L, context.getLong(0));
      assertEquals(channels, context.getInt(8));
      assertEquals(channels == 1 ? 1 : 0, context.get(12));
      for (int i = 13; i < 16; i++) assertEquals(0x5a, context.get(i), "reserved byte " + i);
      AudioResampler.releaseNativeResampler(context);
    }
  }

  // Without input the frames asked are cleared; 441 input frames at 44100 Hz
  // then write 480 output frames at 48000 Hz.
  @ParameterizedTest(name = "{0} channels, stereo output {1}")
  @CsvSource({"2, false, 400, 960", "2, true, 400, 960", "1, true, 400, 960", "1, false, 200, 480"})
  void clearsTheFramesAskedAndWritesTheOutputCountOfTheInput(
      int channels, boolean stereo, int cleared, int written) {
    ByteBuffer context = created(channels, 48000, stereo);
    byte[] output = filled(4000);
    AudioResampler.resampleFromByteArray(context, new byte[0], 0, 0, output, 100, false);
    byte[] expected = filled(4000);
    Arrays.fill(expected, 0, cleared, (byte) 0);
    assertArrayEquals(expected, output);

    AudioResampler.setSourceSampleRate(context, 44100);
    int[] input = new int[441 * channels];
    Arrays.fill(input, 1000);
    output = filled(4000);
    AudioResampler.resampleFromByteArray(context, pcm(input), 0, input.length, output, 0, false);
    short[] out = samples(output);
    for (int i = written / 480; i < out.length; i++) {
      assertEquals(i >= written, out[i] == FILL_SAMPLE, "sample " + i);
    }
    AudioResampler.releaseNativeResampler(context);
  }

  // Weights 0, 30105, 27443, 24780 and 22118 (of 32768) between neighbouring
  // input frames, the first two from the silent frame before the input.
  @ParameterizedTest(name = "{0} at byte offset {1}")
  @CsvSource({"array, 0", "array, 1", "buffer, 0", "buffer, 3"})
  void interpolatesFrom44100To48000(String source, int offset) {
    ByteBuffer context = created(1, 48000, false);
    AudioResampler.setSourceSampleRate(context, 44100);
    byte[] block = pcm(1000, -2000, 3000, -4000, 0);
    byte[] input = new byte[offset + block.length];
    System.arraycopy(block, 0, input, offset, block.length);
    byte[] output = new byte[10];
    if (source.equals("array")) {
      AudioResampler.resampleFromByteArray(context, input, offset, 5, output, 5, false);
    } else {
      AudioResampler.resampleFromByteBuffer(context, direct(input), offset, 5, output, 5, false);
    }
    assertArrayEquals(new short[] {0, 918, -1513, 1781, -1725}, samples(output));
    AudioResampler.releaseNativeResampler(context);
  }

  @Test
  void accumulatingMixesIntoTheOutputAndWrapsAround() {
    ByteBuffer context = created(1, 44100, true);
    AudioResampler.setVolume(context, 1.0f, -0.5f);
    byte[] output = pcm(10, 20, 30, 40, 30000, -30000);
    AudioResampler.resampleFromByteArray(context, pcm(4, 30000, 0), 0, 3, output, 0, true);
    // -30000 + -15000 wraps to 20536.
    assertArrayEquals(new short[] {10, 20, 34, 38, -5536, 20536}, samples(output));
    AudioResampler.releaseNativeResampler(context);
  }

  // Each case is a call that would read or write out of bounds, or whose
  // context was rewritten (byte `at` set to `value`) so that its fields no
  // longer match the instance: the output stays as it was.
  @ParameterizedTest(name = "{0}")
  @CsvSource({
    "clearing beyond the output, 2, 0, 4, 40, 11, false, 0, 0",
    "samples beyond the output, 2, 0, 882, 40, 0, true, 0, 0",
    "negative offset, 2, -2, 4, 40, 2, false, 0, 0",
    "negative length, 2, 0, -4, 40, 2, false, 0, 0",
    "length beyond the input, 2, 2, 882, 4000, 2, false, 0, 0",
    "offset beyond the input, 2, 1765, 0, 40, 2, false, 0, 0",
    "huge length, 2, 0, 2147483647, 40, 2, false, 0, 0",
    "negative clearing, 2, 0, 4, 400, -1, false, 0, 0",
    "huge clearing, 2, 0, 4, 400, 2147483647, false, 0, 0",
    "no channels, 0, 0, 4, 40, 2, false, 0, 0",
    "negative channels, -2, 0, 4, 40, 2, false, 0, 0",
    "channel count rewritten to 1, 2, 0, 882, 16000, 0, true, 8, 1",
    "channel count rewritten to 0, 2, 0, 882, 16000, 0, true, 8, 0",
    "stereo flag rewritten to 1, 2, 0, 882, 16000, 100, false, 12, 1",
    "stereo flag rewritten to 2, 1, 0, 882, 16000, 100, false, 12, 2",
  })
  void badBlocksWriteNothing(
      String name, int channels, int offset, int length, int outputBytes, int frames,
      boolean accumulate, int at, int value) {
    for (boolean fromBuffer : new boolean[] {false, true}) {
      ByteBuffer context = created(channels, 48000, false);
      if (at == 8) context.putInt(at, value);
      if (at == 12) context.put(at, (byte) value);
      byte[] input = pcm(new int[882]);
      byte[] output = filled(outputBytes);
      if (fromBuffer) {
        AudioResampler.resampleFromByteBuffer(
            context, direct(input), offset, length, output, frames, accumulate);
      } else {
        AudioResampler.resampleFromByteArray(
            context, input, offset, length, output, frames, accumulate);
      }
      assertArrayEquals(filled(outputBytes), output, name + (fromBuffer ? " (buffer)" : ""));
      context.putInt(8, channels).put(12, (byte) 0);
      AudioResampler.releaseNativeResampler(context);
    }
  }

  // Too small, not direct, missing, released (twice): every call is a no-op.
  @Test
  void unusableContextsAndInputsAreIgnored() {
    ByteBuffer released = created(2, 48000, false);
    AudioResampler.releaseNativeResampler(released);
    assertEquals(0L, released.getLong(0));
    for (ByteBuffer context :
        new ByteBuffer[] {ByteBuffer.allocateDirect(8), ByteBuffer.allocate(16), null, released}) {
      if (context != released) AudioResampler.createNativeResampler(context, 2, 1, 48000, false);
      AudioResampler.setVolume(context, 1, 1);
      AudioResampler.setSourceSampleRate(context, 44100);
      byte[] output = filled(20);
      AudioResampler.resampleFromByteArray(context, pcm(1, 2), 0, 2, output, 5, false);
      assertArrayEquals(filled(20), output);
      AudioResampler.releaseNativeResampler(context);
      if (context != null && context.capacity() >= 8) assertEquals(0L, context.getLong(0));
    }

    ByteBuffer context = created(2, 48000, false);
    byte[] output = filled(100);
    AudioResampler.resampleFromByteBuffer(
        context, ByteBuffer.wrap(pcm(1, 2, 3, 4)), 0, 4, output, 20, false);
    assertArrayEquals(filled(100), output);
    AudioResampler.releaseNativeResampler(context);
  }

  @Test
  void tamperedContextIsRefusedUntilRestored() {
    ByteBuffer context = created(2, 44100, false);
    context.putInt(8, 1);
    AudioResampler.setVolume(context, 0, 0);
    AudioResampler.releaseNativeResampler(context);
    assertNotEquals(0L, context.getLong(0));
    context.putInt(8, 2);
    byte[] output = new byte[8];
    AudioResampler.resampleFromByteArray(context, pcm(7, 7, 7, 7), 0, 4, output, 2, false);
    assertArrayEquals(new short[] {0, 0, 7, 7}, samples(output), "the gain was changed");
    AudioResampler.releaseNativeResampler(context);
    assertEquals(0L, context.getLong(0));
  }

  @Test
  void cleanerReleasesAnInstanceNeverClosed() throws Exception {
    AudioResampler resampler = new AudioResampler(1, 48000, false);
    Field field = AudioResampler.class.getDeclaredField("context");
    field.setAccessible(true);
    ByteBuffer context = (ByteBuffer) field.get(resampler);
    WeakReference<AudioResampler> reference = new WeakReference<>(resampler);
    resampler = null;
    for (int i = 0; i < 200 && context.getLong(0) != 0; i++) {
      System.gc();
      Thread.sleep(10);
    }
    assertNull(reference.get());
    assertEquals(0L, context.getLong(0), "the instance was not released");
  }

  @Test
  void wrapperResamplesLikeTheRawBridge() {
    byte[] input = new byte[4 * 441];
    new java.util.Random(7).nextBytes(input);
    ByteBuffer context = created(2, 48000, false);
    AudioResampler.setSourceSampleRate(context, 44100);
    AudioResampler.setVolume(context, 0.5f, 2.0f);
    byte[] expected = new byte[4 * 480];
    byte[] output = new byte[4 * 480];
    try (AudioResampler resampler = new AudioResampler(2, 48000, false)) {
      resampler.setSourceSampleRate(44100);
      resampler.setVolume(0.5f, 2.0f);
      assertEquals(480, resampler.getOutputFrameCount(441));
      for (int block = 0; block < 2; block++) {
        AudioResampler.resampleFromByteArray(context, input, 0, 882, expected, 480, false);
        if (block == 0) resampler.resample(input, 0, 882, output, 480, false);
        else resampler.resample(direct(input), 0, 882, output, 480, false);
        assertArrayEquals(expected, output, "block " + block);
      }
    }
    AudioResampler.releaseNativeResampler(context);
  }

  @Test
  void wrapperRejectsBadArgumentsBeforeTheNativeCall() {
    AudioResampler resampler = new AudioResampler(1, 16000, true);
    assertEquals(2, resampler.getOutputChannelCount());
    resampler.setSourceSampleRate(48000);
    assertEquals(48000, resampler.getSourceSampleRate());
    byte[] input = new byte[960];
    for (Executable call : new Executable[] {
        () -> new AudioResampler(3, 48000, false),
        () -> new AudioResampler(1, 0, false),
        () -> resampler.setSourceSampleRate(0),
        () -> resampler.setSourceSampleRate(48001),
        () -> resampler.resample(ByteBuffer.wrap(input), 0, 480, new byte[640], 0, true)}) {
      assertThrows(IllegalArgumentException.class, call);
    }
    for (Executable call : new Executable[] {
        () -> resampler.resample(input, 2, 480, new byte[640], 0, true),
        () -> resampler.resample(input, 0, 480, new byte[639], 0, true),
        () -> resampler.resample(input, 0, 0, new byte[640], 161, false)}) {
      assertThrows(IndexOutOfBoundsException.class, call);
    }
    resampler.resample(input, 0, 480, new byte[640], 160, false);
    resampler.close();
    resampler.close();
    assertThrows(IllegalStateException.class, () -> resampler.setVolume(1, 1));
    assertThrows(IllegalStateException.class,
        () -> resampler.resample(input, 0, 480, new byte[640], 160, false));
  }

  @Test
  void logsEachProblemOnce() throws Exception {
    ChildJvm child = ChildJvm.run(LogScenario.class);
    assertEquals(0, child.exitCode, child.stderr);
    List<String> lines = new ArrayList<>();
    // Without line numbers.
    child.stderr.lines().forEach(line -> lines.add(line.replaceFirst("\\.cc:[0-9]+ ", ".cc: ")));
    assertEquals(
        List.of(
            "AudioResampler : Unsupported sample format, 8 bits, 1 channels",
            "AudioResampler : Unsupported resampling from 0 Hz to 48000 Hz: no output",
            "native : resampler_bridge.cc: Resampler output of 10 bytes is too small for"
                + " 2000 bytes to clear and 0 bytes to resample: nothing resampled.",
            "native : resampler_bridge.cc: Resampler input of 8 samples at byte 0 exceeds"
                + " the 4 bytes given: nothing resampled.",
            "native : resampler_bridge.cc: Bad resampler context: it holds 2 channels and"
                + " stereo flag 0, its instance was made with 1 and 0: call ignored."),
        lines);
  }

  /** The calls of {@link #logsEachProblemOnce}, run in a child JVM whose stderr is read. */
  public static final class LogScenario {
    public static void main(String[] args) {
      ByteBuffer context = context();
      AudioResampler.createNativeResampler(context, 1, 1, 48000, false);
      AudioResampler.releaseNativeResampler(context);
      context = created(1, 48000, false);
      AudioResampler.setSourceSampleRate(context, 0);
      byte[] output = new byte[10];
      AudioResampler.resampleFromByteArray(context, pcm(1, 2), 0, 2, output, 5, false);
      AudioResampler.resampleFromByteArray(context, pcm(1, 2), 0, 2, output, 5, false);
      AudioResampler.resampleFromByteArray(context, pcm(1, 2), 0, 2, output, 1000, false);
      AudioResampler.resampleFromByteBuffer(context, direct(pcm(1, 2)), 0, 8, output, 0, false);
      context.putInt(8, 2);
      AudioResampler.setVolume(context, 1, 1);
      context.putInt(8, 1);
      AudioResampler.releaseNativeResampler(context);
    }
  }
}
