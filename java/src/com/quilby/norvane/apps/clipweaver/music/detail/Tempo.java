package com.quilby.norvane.apps.clipweaver.music.detail;

import java.util.Arrays;

/**
 * The tempo of a list of beat times, read off a straight line through them
 * rather than from one interval, so it is not held to the analysis's whole
 * frames (a 117.6 BPM song reads 117.6, not 120).
 */
public final class Tempo {
  /**
   * An interval is steady when it lies within this fraction of the median
   * interval of one beat, or of two (a beat missed in between).
   */
  private static final double STEADY_TOLERANCE = 0.15;

  /**
   * The ends of the run are dropped while they lie further than this
   * fraction of a beat off the fitted line: a tracker settling keeps a
   * steady but wrong period for a few beats. Whole-frame beats wander by a
   * frame or two around the line (6 % of a beat at 190 BPM), and stay.
   */
  private static final double END_TOLERANCE = 0.1;

  private Tempo() {}

  /**
   * The least-squares slope of beat time against beat number over the
   * longest run of steady intervals, less its ends that stray from the line,
   * in BPM.
   *
   * @param beatTimes ascending beat times in seconds, e.g. from
   *     {@link DefaultLocalMusicDetailExtractor#calculateBeatsInSec}
   * @return the tempo, or NaN with fewer than three beats or no run of two
   *     steady intervals
   */
  public static double precise(float[] beatTimes) {
    int n = beatTimes.length;
    if (n < 3) return Double.NaN;
    double[] intervals = new double[n - 1];
    for (int i = 0; i + 1 < n; i++) intervals[i] = (double) beatTimes[i + 1] - beatTimes[i];
    double[] sorted = intervals.clone();
    Arrays.sort(sorted);
    double median = sorted[sorted.length / 2];
    if (!(median > 0)) return Double.NaN;

    int bestFirst = 0;
    int bestCount = 0;
    int first = 0;
    for (int i = 0; i <= intervals.length; i++) {
      if (i < intervals.length && beatsSpanned(intervals[i], median) > 0) continue;
      if (i - first > bestCount) {
        bestFirst = first;
        bestCount = i - first;
      }
      first = i + 1;
    }
    if (bestCount < 2) return Double.NaN;

    // Beat numbers count the missed beats, so a gap does not bend the line.
    double[] number = new double[bestCount + 1];
    double[] times = new double[bestCount + 1];
    for (int k = 0; k <= bestCount; k++) {
      times[k] = beatTimes[bestFirst + k];
      if (k > 0) number[k] = number[k - 1] + beatsSpanned(intervals[bestFirst + k - 1], median);
    }
    int lo = 0;
    int hi = bestCount;
    Line line = Line.fit(number, times, lo, hi);
    while (hi - lo >= 3) {
      double offLo = Math.abs(line.residual(number[lo], times[lo]));
      double offHi = Math.abs(line.residual(number[hi], times[hi]));
      double limit = END_TOLERANCE * line.slope;
      if (offLo <= limit && offHi <= limit) break;
      if (offLo >= offHi) {
        lo++;
      } else {
        hi--;
      }
      line = Line.fit(number, times, lo, hi);
    }
    return line.slope > 0 ? 60.0 / line.slope : Double.NaN;
  }

  private record Line(double slope, double meanX, double meanT) {
    double residual(double x, double t) {
      return t - meanT - slope * (x - meanX);
    }

    // Least squares of t against x over the points lo..hi.
    static Line fit(double[] x, double[] t, int lo, int hi) {
      double count = hi - lo + 1;
      double meanX = 0;
      double meanT = 0;
      for (int k = lo; k <= hi; k++) {
        meanX += x[k];
        meanT += t[k];
      }
      meanX /= count;
      meanT /= count;
      double sxt = 0;
      double sxx = 0;
      for (int k = lo; k <= hi; k++) {
        double dx = x[k] - meanX;
        sxt += dx * (t[k] - meanT);
        sxx += dx * dx;
      }
      return new Line(sxt / sxx, meanX, meanT);
    }
  }

  private static int beatsSpanned(double interval, double median) {
    for (int beats = 1; beats <= 2; beats++) {
      if (Math.abs(interval - beats * median) <= STEADY_TOLERANCE * median) return beats;
    }
    return 0;
  }
}
