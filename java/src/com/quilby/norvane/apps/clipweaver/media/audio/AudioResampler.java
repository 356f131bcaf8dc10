package com.quilby.norvane.apps.clipweaver.media.audio;

import java.lang.ref.Cleaner;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;

/**
 * Converts interleaved signed 16-bit PCM from a source sample rate to a fixed output rate by
 * linear interpolation, applies a gain per output channel and mixes the result into a byte
 * array.
 *
 * <p>Samples are 16-bit signed integers in the platform's byte order (little-endian), channel
 * 0 first in each frame, on input and output alike. Output has two channels per frame for
 * stereo input or when stereo output was asked for (mono input is then written to both sides,
 * each with its own gain), and one otherwise.
 *
 * <p>Successive {@code resample} calls form one stream: each block continues from where the
 * previous one ended, and the first output of a fresh resampler comes from a silent frame
 * before the input (the stream is delayed by up to one input frame). Sums that leave the
 * 16-bit range wrap around; nothing clamps them.
 *
 * <p>An instance holds native memory until {@link #close()}: use try-with-resources. An
 * instance that becomes unreachable unclosed is freed by a {@link Cleaner} at some later
 * garbage collection, which may be much later or never; close() frees at once. Its methods
 * are synchronized, so it may be handed between threads, but one stream has one
 * order of blocks: drive it from one thread at a time. Different instances are independent.
 *
 * <p>The static {@code native} methods are the raw bridge beneath this class: they take a
 * caller-owned direct buffer of {@link #getNativeResamplerContextSize()} bytes as the
 * context, check nothing on the Java side, and on bad input log one native error line and
 * leave the output untouched instead of throwing. The native side takes every bound from the
 * instance itself: a context whose channel count or stereo flag no longer matches its
 * instance is refused as a whole (one error line; nothing read, written or released). Prefer
 * the instance methods.
 */
public final class AudioResampler implements AutoCloseable {
  static {
    System.loadLibrary("clipweaver_native");
  }

  /** The largest supported ratio of source rate to output rate. */
  public static final int MAX_RATE_RATIO = 3;

  private static final int BYTES_PER_SAMPLE = 2;
  private static final Cleaner CLEANER = Cleaner.create();

  private final ByteBuffer context;
  private final int channelCount;
  private final int outputSampleRate;
  private final boolean stereoOutput;
  private final Cleaner.Cleanable release;
  private int sourceSampleRate;
  private boolean closed;

  /**
   * Creates a resampler whose source rate is the output rate until {@link
   * #setSourceSampleRate} changes it, with both gains 1.0.
   *
   * @param channelCount interleaved input channels, 1 or 2
   * @param outputSampleRate output rate in Hz, greater than 0
   * @param stereoOutput with mono input, write two output channels per frame; ignored for
   *     stereo input, which always gives two
   * @throws IllegalArgumentException for other channel counts or rates
   */
  public AudioResampler(int channelCount, int outputSampleRate, boolean stereoOutput) {
    if (channelCount != 1 && channelCount != 2) {
      throw new IllegalArgumentException("channelCount must be 1 or 2: " + channelCount);
    }
    if (outputSampleRate <= 0) {
      throw new IllegalArgumentException("outputSampleRate must be positive: " + outputSampleRate);
    }
    this.channelCount = channelCount;
    this.outputSampleRate = outputSampleRate;
    this.stereoOutput = stereoOutput;
    this.sourceSampleRate = outputSampleRate;
    context = ByteBuffer.allocateDirect(getNativeResamplerContextSize()).order(ByteOrder.nativeOrder());
    createNativeResampler(context, BYTES_PER_SAMPLE, channelCount, outputSampleRate, stereoOutput);
    release = CLEANER.register(this, new Release(context));
  }

  /** Must not refer to the resampler, or it would keep it reachable. */
  private static final class Release implements Runnable {
    private final ByteBuffer context;

    Release(ByteBuffer context) {
      this.context = context;
    }

    @Override
    public void run() {
      releaseNativeResampler(context);
    }
  }

  public int getChannelCount() {
    return channelCount;
  }

  /** Output rate in Hz. */
  public int getOutputSampleRate() {
    return outputSampleRate;
  }

  /** Source rate in Hz, as last set. */
  public synchronized int getSourceSampleRate() {
    return sourceSampleRate;
  }

  /** Output samples per frame, 1 or 2; each takes 2 bytes. */
  public int getOutputChannelCount() {
    return channelCount == 2 || stereoOutput ? 2 : 1;
  }

  /**
   * Sets the rate of the input that following calls pass in. Takes effect at the next block.
   *
   * @param sampleRate source rate in Hz, from 1 to {@link #MAX_RATE_RATIO} times the output
   *     rate
   * @throws IllegalArgumentException outside that range
   * @throws IllegalStateException after {@link #close()}
   */
  public synchronized void setSourceSampleRate(int sampleRate) {
    checkOpen();
    if (!ratesSupported(sampleRate, outputSampleRate)) {
      throw new IllegalArgumentException(
          "source rate " + sampleRate + " Hz outside 1 to " + MAX_RATE_RATIO + " x "
              + outputSampleRate + " Hz");
    }
    setSourceSampleRate(context, sampleRate);
    sourceSampleRate = sampleRate;
  }

  /**
   * Sets the linear gains of output channel 0 and 1 (1.0 leaves the level unchanged). With
   * mono output only {@code left} is used. Scaled values beyond the 32-bit range saturate; NaN
   * scales to 0.
   *
   * @throws IllegalStateException after {@link #close()}
   */
  public synchronized void setVolume(float left, float right) {
    checkOpen();
    setVolume(context, left, right);
  }

  /**
   * The number of output frames a block of {@code inputFrames} frames yields at the current
   * rates: floor(output rate x inputFrames / source rate). A block may yield one frame fewer
   * when the position carried from the previous block runs out of input first.
   */
  public synchronized int getOutputFrameCount(int inputFrames) {
    return (int) Math.min(Integer.MAX_VALUE, outputFrames(inputFrames));
  }

  private static boolean ratesSupported(int sourceRate, int outputRate) {
    return sourceRate > 0 && outputRate > 0
        && (long) sourceRate <= (long) MAX_RATE_RATIO * outputRate;
  }

  private long outputFrames(int inputFrames) {
    return inputFrames <= 0 ? 0 : (long) outputSampleRate * inputFrames / sourceSampleRate;
  }

  /**
   * Resamples one block from a byte array and mixes it into {@code output}.
   *
   * @param input interleaved 16-bit samples
   * @param inputOffset byte offset of the block in {@code input}
   * @param inputSamples samples in the block, all channels counted (frames x channel count); a
   *     trailing partial frame is ignored
   * @param output receives the output samples from byte 0 on; it must hold {@link
   *     #getOutputFrameCount} frames of the block, and {@code outputFrameCount} frames when not
   *     accumulating
   * @param outputFrameCount output frames to clear before mixing when {@code accumulate} is
   *     false; usually {@code getOutputFrameCount(inputSamples / getChannelCount())}
   * @param accumulate true to add to the contents of {@code output}, false to clear its first
   *     {@code outputFrameCount} frames first
   * @throws IndexOutOfBoundsException if the block reaches past {@code input} or the output
   *     does not fit in {@code output}; nothing is written then
   * @throws NullPointerException if an array is null
   * @throws IllegalStateException after {@link #close()}
   */
  public synchronized void resample(
      byte[] input, int inputOffset, int inputSamples, byte[] output, int outputFrameCount,
      boolean accumulate) {
    checkOpen();
    checkBlock(input.length, inputOffset, inputSamples, output, outputFrameCount, accumulate);
    resampleFromByteArray(
        context, input, inputOffset, inputSamples, output, outputFrameCount, accumulate);
  }

  /**
   * Resamples one block from a direct buffer and mixes it into {@code output}; as {@link
   * #resample(byte[], int, int, byte[], int, boolean)}, with {@code inputOffset} counted from
   * the buffer's first byte (its position and limit are ignored and left unchanged).
   *
   * @throws IllegalArgumentException if {@code input} is not a direct buffer
   */
  public synchronized void resample(
      ByteBuffer input, int inputOffset, int inputSamples, byte[] output, int outputFrameCount,
      boolean accumulate) {
    checkOpen();
    if (!input.isDirect()) {
      throw new IllegalArgumentException("input must be a direct buffer");
    }
    checkBlock(input.capacity(), inputOffset, inputSamples, output, outputFrameCount, accumulate);
    resampleFromByteBuffer(
        context, input, inputOffset, inputSamples, output, outputFrameCount, accumulate);
  }

  /** Frees the native resampler. Further calls to close do nothing; others throw. */
  @Override
  public synchronized void close() {
    if (closed) return;
    closed = true;
    release.clean();
  }

  private void checkOpen() {
    if (closed) throw new IllegalStateException("resampler is closed");
  }

  private void checkBlock(
      int inputBytes, int inputOffset, int inputSamples, byte[] output, int outputFrameCount,
      boolean accumulate) {
    if (inputOffset < 0 || inputSamples < 0
        || (long) inputOffset + (long) BYTES_PER_SAMPLE * inputSamples > inputBytes) {
      throw new IndexOutOfBoundsException(
          inputSamples + " samples at byte " + inputOffset + " of " + inputBytes + " input bytes");
    }
    if (!accumulate && outputFrameCount < 0) {
      throw new IndexOutOfBoundsException("negative outputFrameCount " + outputFrameCount);
    }
    long cleared = accumulate ? 0 : outputFrameCount;
    long written = outputFrames(inputSamples / channelCount);
    long bytes = Math.max(cleared, written) * BYTES_PER_SAMPLE * getOutputChannelCount();
    if (bytes > output.length) {
      throw new IndexOutOfBoundsException(
          "output of " + output.length + " bytes cannot take " + bytes + " bytes");
    }
  }

  /** Bytes of the native context: 16. */
  public static native int getNativeResamplerContextSize();

  /**
   * Builds a native resampler into {@code context} (gains 1.0, source rate = output rate). A
   * resampler already in the context is overwritten, not freed.
   *
   * @param context direct buffer of at least {@link #getNativeResamplerContextSize()} bytes;
   *     bytes 0-7 receive the instance, 8-11 {@code channelCount}, 12 the stereo flag
   * @param bytesPerSample 2; other sizes are logged as unsupported
   * @param channelCount interleaved input channels; 1 and 2 are supported
   * @param sampleRate output rate in Hz
   */
  public static native void createNativeResampler(
      ByteBuffer context, int bytesPerSample, int channelCount, int sampleRate,
      boolean stereoOutput);

  /** Sets the gains of output channels 0 and 1. */
  public static native void setVolume(ByteBuffer context, float left, float right);

  /** Sets the source rate in Hz; beyond 3 times the output rate, resampling logs and stops. */
  public static native void setSourceSampleRate(ByteBuffer context, int sampleRate);

  /** The raw form of {@link #resample(byte[], int, int, byte[], int, boolean)}. */
  public static native void resampleFromByteArray(
      ByteBuffer context, byte[] input, int inputOffset, int inputLength, byte[] output,
      int outputFrameCount, boolean accumulate);

  /**
   * The raw form of {@link #resample(ByteBuffer, int, int, byte[], int, boolean)}; a heap
   * buffer makes it return without writing.
   */
  public static native void resampleFromByteBuffer(
      ByteBuffer context, ByteBuffer input, int inputOffset, int inputLength, byte[] output,
      int outputFrameCount, boolean accumulate);

  /** Frees the resampler in {@code context} and clears it there; harmless when repeated. */
  public static native void releaseNativeResampler(ByteBuffer context);
}
