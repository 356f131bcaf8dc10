package com.quilby.norvane.apps.clipweaver.music.detail;

import java.lang.reflect.Method;
import java.nio.ByteBuffer;
import java.util.ArrayList;
import java.util.List;

/**
 * One beat analysis in a child JVM, chosen by name; prints the progress
 * bytes on the first line of stdout and the beat count on the second.
 */
public final class BeatScenario {
  private BeatScenario() {}

  public static void main(String[] args) {
    String name = args[0];
    List<Integer> progress = new ArrayList<>();
    int cancelAt = name.equals("cancel-first") ? 0 : name.equals("cancel-onset") ? 33 : -1;
    DefaultLocalMusicDetailExtractor extractor =
        new DefaultLocalMusicDetailExtractor(
            percent -> {
              progress.add(percent);
              return cancelAt >= 0 && percent >= cancelAt;
            });
    short[] groove = TestTracks.groove(8, 44100, 1, 120);
    ByteBuffer pcm = TestTracks.direct(groove);
    float[] beats;
    switch (name) {
      case "channels-zero":
        beats = extractor.calculateBeatsInSec(pcm, pcm.capacity(), 44100, 0);
        break;
      case "one-byte":
        beats = extractor.calculateBeatsInSec(pcm, 1, 44100, 1);
        break;
      case "shorter-than-window":
        beats = extractor.calculateBeatsInSec(pcm, 200, 44100, 1);
        break;
      case "silence":
        beats = extractor.calculateBeatsInSec(ByteBuffer.allocateDirect(88200), 88200, 44100, 1);
        break;
      case "heap-buffer":
        beats = extractor.calculateBeatsInSec(ByteBuffer.allocate(88200), 88200, 44100, 1);
        break;
      case "oversized":
        beats = extractor.calculateBeatsInSec(pcm, pcm.capacity() + 1000, 44100, 1);
        break;
      case "range-refused-natively":
        beats = rangeEntry(extractor, pcm, Float.NaN, 180);
        break;
      default:
        beats = extractor.calculateBeatsInSec(pcm, pcm.capacity(), 44100, 1);
        break;
    }
    System.out.println(progress);
    System.out.println(beats.length);
  }

  // The native entry behind the range overload, reached past its Java check.
  private static float[] rangeEntry(
      DefaultLocalMusicDetailExtractor extractor, ByteBuffer pcm, float minBpm, float maxBpm) {
    try {
      Method entry =
          DefaultLocalMusicDetailExtractor.class.getDeclaredMethod(
              "calculateBeatsInTempoRange",
              ByteBuffer.class, int.class, int.class, int.class, float.class, float.class);
      entry.setAccessible(true);
      return (float[]) entry.invoke(extractor, pcm, pcm.capacity(), 44100, 1, minBpm, maxBpm);
    } catch (ReflectiveOperationException e) {
      throw new AssertionError(e);
    }
  }
}
