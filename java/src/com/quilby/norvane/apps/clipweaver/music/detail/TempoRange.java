package com.quilby.norvane.apps.clipweaver.music.detail;

import java.math.BigDecimal;
import java.math.RoundingMode;

/**
 * The check of a tempo range before any native work, word for word the
 * native library's: the tracker needs at least three beat periods and at
 * least its beam width of states at the input's frame rate.
 */
final class TempoRange {
  static final double SLOWEST = 30.0;
  static final double FASTEST = 1200.0;
  private static final int BEAM_WIDTH = 100;
  // The analysis window and overlap, in seconds.
  private static final float WINDOW_SECONDS = 0.04f;
  private static final float OVERLAP_SECONDS = 0.03f;
  private static final double MAX_SAMPLE_RATE = 1e6;

  private TempoRange() {}

  /** Null when the range can be tracked at this sample rate, otherwise why not. */
  static String error(float minBpm, float maxBpm, int sampleRate) {
    double min = minBpm;
    double max = maxBpm;
    String range = "tempo range " + bpm(min) + "-" + bpm(max) + " BPM";
    String allowed = bpm(SLOWEST) + "-" + bpm(FASTEST) + " BPM";
    if (!Double.isFinite(min) || !Double.isFinite(max)) {
      return range + " is not a range: both ends must be numbers within " + allowed;
    }
    if (!(min < max)) return range + " is empty: the minimum must be below the maximum";
    if (min < SLOWEST || max > FASTEST) return range + " is outside " + allowed;
    int framesPerSecond = framesPerSecond(sampleRate);
    if (framesPerSecond <= 0) return null;

    double minLag = Math.round(60000.0 / max * (0.001 * framesPerSecond));
    double maxLag = Math.round(60000.0 / min * (0.001 * framesPerSecond));
    int periods = (int) (maxLag - minLag) + 1;
    int states = (int) ((minLag + maxLag) * periods / 2);
    String at =
        range + " is too narrow: at " + framesPerSecond + " frames per second it holds ";
    if (periods < 3) {
      return at + periods + " beat period" + (periods == 1 ? "" : "s") + ", 3 are needed";
    }
    if (states < BEAM_WIDTH) {
      return at + states + " tracker states, " + BEAM_WIDTH + " are needed";
    }
    return null;
  }

  /** Whole analysis frames per second, 0 for a rate the analysis refuses. */
  static int framesPerSecond(int sampleRate) {
    if (!(sampleRate > 0 && sampleRate <= MAX_SAMPLE_RATE)) return 0;
    long step =
        Math.round((double) WINDOW_SECONDS * sampleRate)
            - Math.round((double) OVERLAP_SECONDS * sampleRate);
    return step > 0 ? (int) (sampleRate / (double) step) : 0;
  }

  // Two decimals at most, rounded as C's printf rounds, trailing zeros dropped.
  private static String bpm(double value) {
    if (Double.isNaN(value)) return "NaN";
    if (Double.isInfinite(value)) return value > 0 ? "Infinity" : "-Infinity";
    BigDecimal rounded = new BigDecimal(value).setScale(2, RoundingMode.HALF_EVEN);
    return rounded.signum() == 0 ? "0" : rounded.stripTrailingZeros().toPlainString();
  }
}
