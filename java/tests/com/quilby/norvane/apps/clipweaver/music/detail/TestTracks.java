package com.quilby.norvane.apps.clipweaver.music.detail;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.Random;

/** Synthesised test audio: drum-like grooves with a known tempo. */
final class TestTracks {
  private TestTracks() {}

  /** Kicks on every beat from time 0, snares on 2 and 4, hi-hats off the beat; channels equal. */
  static short[] groove(double seconds, int sampleRate, int channels, double bpm) {
    int frames = (int) Math.round(seconds * sampleRate);
    double[] mono = new double[frames];
    double beat = 60.0 / bpm;
    Random noise = new Random(42);
    for (int b = 0; b * beat < seconds; b++) {
      addKick(mono, sampleRate, b * beat);
      if (b % 2 == 1) addNoiseBurst(mono, sampleRate, b * beat, 0.12, 0.35, noise);
      addNoiseBurst(mono, sampleRate, (b + 0.5) * beat, 0.03, 0.12, noise);
    }
    short[] pcm = new short[frames * channels];
    for (int i = 0; i < frames; i++) {
      short s = (short) Math.max(-32768, Math.min(32767, Math.round(mono[i] * 20000)));
      for (int c = 0; c < channels; c++) pcm[i * channels + c] = s;
    }
    return pcm;
  }

  private static void addKick(double[] out, int rate, double at) {
    int start = (int) Math.round(at * rate);
    int length = (int) (0.25 * rate);
    double phase = 0;
    for (int i = 0; i < length && start + i < out.length; i++) {
      double t = (double) i / rate;
      phase += 2 * Math.PI * (50 + 100 * Math.exp(-t * 30)) / rate;
      out[start + i] += Math.sin(phase) * Math.exp(-t * 12);
    }
  }

  private static void addNoiseBurst(
      double[] out, int rate, double at, double decaySeconds, double gain, Random noise) {
    int start = (int) Math.round(at * rate);
    int length = (int) (decaySeconds * 4 * rate);
    for (int i = 0; i < length && start + i < out.length; i++) {
      double t = (double) i / rate;
      out[start + i] += gain * (noise.nextDouble() * 2 - 1) * Math.exp(-t / decaySeconds);
    }
  }

  /** The samples as a little-endian direct buffer. */
  static ByteBuffer direct(short[] pcm) {
    ByteBuffer buffer = ByteBuffer.allocateDirect(pcm.length * 2).order(ByteOrder.LITTLE_ENDIAN);
    buffer.asShortBuffer().put(pcm);
    return buffer;
  }

  static double medianInterval(float[] beats) {
    double[] intervals = new double[beats.length - 1];
    for (int i = 0; i < intervals.length; i++) intervals[i] = beats[i + 1] - beats[i];
    java.util.Arrays.sort(intervals);
    return intervals[intervals.length / 2];
  }
}
