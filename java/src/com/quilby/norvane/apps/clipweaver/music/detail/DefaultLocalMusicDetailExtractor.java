package com.quilby.norvane.apps.clipweaver.music.detail;

import java.nio.ByteBuffer;

/**
 * Finds the beats of a piece of music in native code.
 *
 * <p>One instance may serve many calls, one at a time per instance; different
 * instances may run on different threads at once. Progress is reported to
 * {@link #shouldCancelExtraction(byte)} on the thread that called
 * {@link #calculateBeatsInSec}, which also lets the caller cancel.
 */
public class DefaultLocalMusicDetailExtractor {
  static {
    System.loadLibrary("clipweaver_native");
  }

  /** Receives progress reports of a running analysis. */
  @FunctionalInterface
  public interface ProgressListener {
    /**
     * @param percent overall progress, 0 to 99, never decreasing within a call
     * @return true to cancel the analysis; the call then returns an empty array
     */
    boolean onProgress(int percent);
  }

  private volatile ProgressListener listener;

  /** An extractor without a listener: it reports nowhere and never cancels. */
  public DefaultLocalMusicDetailExtractor() {}

  /** An extractor that reports progress to {@code listener} (may be null). */
  public DefaultLocalMusicDetailExtractor(ProgressListener listener) {
    this.listener = listener;
  }

  /** Replaces the listener; null removes it. Takes effect at the next report. */
  public void setProgressListener(ProgressListener listener) {
    this.listener = listener;
  }

  /**
   * Analyses PCM audio and returns its beat times.
   *
   * @param pcm a direct buffer of interleaved signed 16-bit little-endian
   *     samples, channel 0 first in each frame, read from its start address
   *     (its position is ignored); a heap buffer yields an empty array
   * @param sizeInBytes bytes to analyse; a trailing partial frame is ignored
   *     and a size beyond the buffer's capacity is clamped to it
   * @param sampleRate samples per second of one channel, in Hz
   * @param channelCount interleaved channels per frame, at least 1
   * @return beat times in seconds from the start of the buffer, ascending;
   *     empty when the input is too short, silent, invalid or the analysis was
   *     cancelled. The caller owns the array.
   */
  public native float[] calculateBeatsInSec(
      ByteBuffer pcm, int sizeInBytes, int sampleRate, int channelCount);

  /**
   * Analyses PCM audio as {@link #calculateBeatsInSec(ByteBuffer, int, int, int)}
   * does, with the tracker held to tempi from {@code minBpm} to {@code maxBpm}.
   * Use it when the tempo is roughly known and the default finds half, double
   * or two-thirds time: a range of the expected tempo divided and multiplied
   * by 1.3 suits most music. The tracker favours the geometric middle of the
   * range; a range of two octaves or more around 120 BPM keeps its own
   * preference for 120, so 75 to 1200 BPM gives exactly the four-argument
   * call's beats. Progress and cancellation are the same.
   *
   * @param minBpm slowest tempo, at least 30
   * @param maxBpm fastest tempo, above {@code minBpm} and at most 1200
   * @throws IllegalArgumentException before any analysis when the range is not
   *     finite, empty, outside 30 to 1200 BPM, or too narrow for the tracker at
   *     this sample rate (it needs three beat periods and 100 states); the
   *     message says which
   */
  public float[] calculateBeatsInSec(
      ByteBuffer pcm, int sizeInBytes, int sampleRate, int channelCount, float minBpm, float maxBpm) {
    String error = TempoRange.error(minBpm, maxBpm, sampleRate);
    if (error != null) throw new IllegalArgumentException(error);
    return calculateBeatsInTempoRange(pcm, sizeInBytes, sampleRate, channelCount, minBpm, maxBpm);
  }

  // Its own name: the JVM binds native methods by short name first, so a
  // second native calculateBeatsInSec would reach the four-argument entry.
  private native float[] calculateBeatsInTempoRange(
      ByteBuffer pcm, int sizeInBytes, int sampleRate, int channelCount, float minBpm, float maxBpm);

  /**
   * Called by the native analysis with its progress, on the calling thread.
   * Override it, or set a {@link ProgressListener}, to follow or cancel.
   *
   * @param progress overall progress, 0 to 99
   * @return true to cancel the analysis
   */
  public boolean shouldCancelExtraction(byte progress) {
    ProgressListener current = listener;
    return current != null && current.onProgress(progress);
  }
}
