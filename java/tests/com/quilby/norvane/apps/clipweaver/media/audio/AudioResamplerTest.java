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
import java.util.Arrays;
import java.util.List;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.function.Executable;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;

public class AudioResamplerTest {
  // A context checked on the way: instance, channel count and stereo flag stored, and the
  // reserved bytes left as the 0x5a every byte starts as.
  private static ByteBuffer created(int channels, int rate, boolean stereoOutput) {
    assertEquals(16, AudioResampler.getNativeResamplerContextSize());
    ByteBuffer context = ByteBuffer.allocateDirect(16).order(ByteOrder.nativeOrder());
    for (int i = 0; i < 16; i++) context.put(i, (byte) 0x5a);
    AudioResampler.createNativeResampler(context, 2, channels, rate, stereoOutput);
    assertNotEquals(0x5a5a5a5a5a5a5a5aL, context.getLong(0));
    assertEquals(channels, context.getInt(8));
    assertEquals(stereoOutput ? 1 : 0, context.get(12));
    for (int i = 13; i < 16; i++) assertEquals(0x5a, context.get(i), "reserved byte " + i);
    return context;
  }

  // Samples as text, in native byte order; "-" stands for 0x5555, the filling of output
  // that the call must leave alone.
  private static byte[] pcm(String text) {
    String[] words = text == null ? new String[0] : text.split(" ");
    ByteBuffer bytes = ByteBuffer.allocate(2 * words.length).order(ByteOrder.nativeOrder());
    for (String word : words) bytes.putShort(word.equals("-") ? 0x5555 : Short.parseShort(word));
    return bytes.array();
  }

  private static ByteBuffer direct(byte[] bytes) {
    return ByteBuffer.allocateDirect(bytes.length).put(bytes).clear();
  }

  private static void resample(ByteBuffer context, boolean fromBuffer, byte[] in, int offset,
      int length, byte[] out, int frames, boolean add) {
    if (fromBuffer) {
      AudioResampler.resampleFromByteBuffer(context, direct(in), offset, length, out, frames, add);
    } else {
      AudioResampler.resampleFromByteArray(context, in, offset, length, out, frames, add);
    }
  }

  // Raw entries and wrapper, from array and buffer: output at 48000 Hz, the frames asked
  // cleared unless accumulating, then the input mixed in, interpolated between neighbours
  // from a silent frame before the input (at 44100 Hz weights 0, 30105, 27443, 24780, 22118
  // of 32768). Input before " | " is an earlier block, whose last frame replaces the silence.
  @ParameterizedTest(name = "{0}")
  @CsvSource({
    "44100 Hz, 1, false, 44100, 1, 1, 1000 -2000 3000 -4000 0, , 5, false, 0 918 -1513 1781 -1725",
    "mono to stereo, 1, true, 24000, 0.5, 2, 1000 2000 3000, , 7, false,"
        + " 0 0 250 1000 500 2000 750 3000 1000 4000 1250 5000 0 0 - -",
    "stereo, 2, false, 24000, 1, -0.5, 1000 -1000 2000 -2000 3000 -3000, , 7, false,"
        + " 0 0 500 250 1000 500 1500 750 2000 1000 2500 1250 0 0 - -",
    "stereo after a block, 2, false, 24000, 1, -0.5, 5000 -5000 3000 -3000 | 1000 -1000 2000 -2000,"
        + " , 4, false, 3000 1500 2000 1000 1000 500 1500 750",
    "no input, 2, true, 24000, 1, 1, , , 3, false, 0 0 0 0 0 0 - -",
    // Accumulating ignores the frames to clear; -30000 + -15000 wraps to 20536.
    "accumulating, 1, true, 48000, 1, -0.5, 4 30000 0, 10 20 30 40 30000 -30000 5 5, 9, true,"
        + " 10 20 34 38 -5536 20536 5 5",
  })
  void clearsAndResamplesIntoTheOutput(String name, int channels, boolean stereo, int rate,
      float left, float right, String input, String before, int frames, boolean accumulate,
      String expected) {
    String[] blocks = input == null ? new String[] {null} : input.split(" [|] ");
    byte[] earlier = pcm(blocks.length > 1 ? blocks[0] : null);
    byte[] block = pcm(blocks[blocks.length - 1]);
    int length = block.length / 2;
    for (int offset : new int[] {0, 3}) {
      byte[] in = new byte[offset + block.length];
      System.arraycopy(block, 0, in, offset, block.length);
      for (int way = 0; way < 4; way++) {
        byte[] output = pcm(before == null ? expected.replaceAll("[0-9-]+", "-") : before);
        if (way < 2) {
          ByteBuffer context = created(channels, 48000, stereo);
          AudioResampler.setSourceSampleRate(context, rate);
          AudioResampler.setVolume(context, left, right);
          resample(context, false, earlier, 0, earlier.length / 2, new byte[64], 0, false);
          resample(context, way == 1, in, offset, length, output, frames, accumulate);
          AudioResampler.releaseNativeResampler(context);
          assertEquals(0L, context.getLong(0));
        } else {
          try (AudioResampler resampler = new AudioResampler(channels, 48000, stereo)) {
            resampler.setSourceSampleRate(rate);
            resampler.setVolume(left, right);
            resampler.resample(earlier, 0, earlier.length / 2, new byte[64], 0, false);
            if (way == 2) resampler.resample(in, offset, length, output, frames, accumulate);
            else resampler.resample(direct(in), offset, length, output, frames, accumulate);
          }
        }
        assertArrayEquals(pcm(expected), output, "offset " + offset + ", way " + way);
      }
    }
  }

  // Each case is a call that would read or write out of bounds, or whose context is
  // unusable: rewritten to disagree with its instance, too small, on the heap, missing or
  // released. The output stays as it was; a second release is harmless.
  @ParameterizedTest(name = "{0}")
  @CsvSource({
    "clearing beyond the output, 2, 0, 4, 40, 11, false, fine",
    "samples beyond the output, 2, 0, 882, 40, 0, true, fine",
    "negative offset, 2, -2, 4, 40, 2, false, fine",
    "negative length, 2, 0, -4, 40, 2, false, fine",
    "length beyond the input, 2, 2, 882, 4000, 2, false, fine",
    "offset beyond the input, 2, 1765, 0, 40, 2, false, fine",
    "huge length, 2, 0, 2147483647, 40, 2, false, fine",
    "negative clearing, 2, 0, 4, 400, -1, false, fine",
    "huge clearing, 2, 0, 4, 400, 2147483647, false, fine",
    "no channels, 0, 0, 4, 40, 2, false, fine",
    "negative channels, -2, 0, 4, 40, 2, false, fine",
    "input on the heap, 2, 0, 4, 100, 20, false, heap input",
    "channel count rewritten to 1, 2, 0, 882, 16000, 0, true, channels 1",
    "channel count rewritten to 0, 2, 0, 882, 16000, 0, true, channels 0",
    "stereo flag rewritten to 1, 2, 0, 882, 16000, 100, false, flag 1",
    "stereo flag rewritten to 2, 1, 0, 882, 16000, 100, false, flag 2",
    "context of 8 bytes, 1, 0, 2, 20, 5, false, 8 bytes",
    "context on the heap, 1, 0, 2, 20, 5, false, heap",
    "no context, 1, 0, 2, 20, 5, false, none",
    "released context, 1, 0, 2, 20, 5, false, released",
  })
  void badCallsWriteNothing(String name, int channels, int offset, int length, int outputBytes,
      int frames, boolean accumulate, String kind) {
    for (boolean fromBuffer : new boolean[] {false, true}) {
      if (kind.equals("heap input") && !fromBuffer) continue;
      ByteBuffer context = switch (kind) {
        case "8 bytes" -> ByteBuffer.allocateDirect(8);
        case "heap" -> ByteBuffer.allocate(16);
        case "none" -> null;
        default -> ByteBuffer.allocateDirect(16).order(ByteOrder.nativeOrder());
      };
      AudioResampler.createNativeResampler(context, 2, channels, 48000, false);
      if (kind.equals("released")) AudioResampler.releaseNativeResampler(context);
      if (kind.startsWith("channels ")) context.putInt(8, kind.charAt(9) - '0');
      if (kind.startsWith("flag ")) context.put(12, (byte) (kind.charAt(5) - '0'));
      AudioResampler.setVolume(context, 1, 1);
      AudioResampler.setSourceSampleRate(context, 48000);
      byte[] input = new byte[1764];
      byte[] untouched = pcm("- ".repeat(outputBytes / 2).strip());
      byte[] output = untouched.clone();
      if (kind.equals("heap input")) {
        AudioResampler.resampleFromByteBuffer(
            context, ByteBuffer.wrap(input), offset, length, output, frames, accumulate);
      } else {
        resample(context, fromBuffer, input, offset, length, output, frames, accumulate);
      }
      assertArrayEquals(untouched, output, name + (fromBuffer ? " (buffer)" : ""));
      if (kind.matches("(channels|flag) .")) context.putInt(8, channels).put(12, (byte) 0);
      AudioResampler.releaseNativeResampler(context);
      if (context != null) assertEquals(0L, context.getLong(0));
    }
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

  // Mono in, stereo out: 480 samples at 48000 Hz make 160 frames of 4 bytes at 16000 Hz.
  @Test
  void wrapperChecksItsArgumentsBeforeTheNativeCall() {
    byte[] input = new byte[960];
    AudioResampler resampler = new AudioResampler(1, 16000, true);
    resampler.setSourceSampleRate(48000);
    assertEquals(160, resampler.getOutputFrameCount(480));
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

  // Bytes to resample count output frames: 2 at 24000 Hz make 4 at 48000. A tampered
  // context is refused, and its instance kept, until it is restored.
  @Test
  void logsEachProblemOnce() throws Exception {
    ChildJvm child = ChildJvm.run(LogScenario.class);
    assertEquals("true\n0\n", child.stdout());
    String tampered = "Bad resampler context: it holds 1 channels and stereo flag 0, its"
        + " instance was made with 2 and 0: call ignored.";
    assertEquals(List.of("Resampler output of 10 bytes is too small for 2000 bytes to clear and"
            + " 8 bytes to resample: nothing resampled.",
            "Resampler input of 8 samples at byte 0 exceeds the 4 bytes given: nothing resampled.",
            tampered, tampered),
        child.nativeTexts());
    assertEquals(child.nativeTexts().size(), child.stderr().lines().count());
  }

  /** The calls of {@link #logsEachProblemOnce}, run in a child JVM whose stderr is read. */
  public static final class LogScenario {
    // Without JUnit on the class path, so without the checks of created().
    public static void main(String[] args) {
      ByteBuffer context = ByteBuffer.allocateDirect(16).order(ByteOrder.nativeOrder());
      AudioResampler.createNativeResampler(context, 2, 1, 48000, false);
      AudioResampler.setSourceSampleRate(context, 24000);
      byte[] output = new byte[10];
      AudioResampler.resampleFromByteArray(context, new byte[4], 0, 2, output, 1000, false);
      AudioResampler.resampleFromByteBuffer(context, direct(new byte[4]), 0, 8, output, 0, false);
      AudioResampler.releaseNativeResampler(context);

      AudioResampler.createNativeResampler(context, 2, 2, 48000, false);
      context.putInt(8, 1);
      AudioResampler.setVolume(context, 0, 0);
      AudioResampler.releaseNativeResampler(context);
      context.putInt(8, 2);
      output = new byte[8];
      AudioResampler.resampleFromByteArray(context, pcm("7 7 7 7"), 0, 4, output, 2, false);
      // Still at unit gain: the input one frame late.
      System.out.println(Arrays.equals(pcm("0 0 7 7"), output));
      AudioResampler.releaseNativeResampler(context);
      System.out.println(context.getLong(0));
    }
  }
}
