package com.quilby.norvane.apps.clipweaver.aggregator;

/**
 * Order statistics on float arrays, computed in native code.
 *
 * <p>Stateless: any thread may call at any time, as long as no other thread writes the
 * same array during the call.
 */
public final class Algorithms {
  static {
    System.loadLibrary("clipweaver_native");
  }

  private Algorithms() {}

  /**
   * Returns the value that would stand at index {@code nth} if {@code values[first, last)}
   * were sorted, without sorting it (a partial selection, linear time on average).
   *
   * <p>The order of {@code values} after the call is unspecified (the runtime may let the
   * selection reorder the slice in place); take the result from the return value only.
   * Slices containing NaN give an unspecified member of the slice.
   *
   * @param values the array holding the slice; not null
   * @param first index of the first element of the slice
   * @param nth index of the element to select; {@code first <= nth < last}
   * @param last index one past the last element of the slice; at most {@code values.length}
   * @param ascending greater than 0 for ascending order, 0 or less for descending order
   * @return the selected value
   * @throws NullPointerException if {@code values} is null
   * @throws IndexOutOfBoundsException unless {@code 0 <= first <= nth < last <= values.length};
   *     nothing is read then
   */
  public static native float nthElement(float[] values, int first, int nth, int last, int ascending);

  /**
   * Returns the value at rank {@code nth} (0-based) of the whole array in the given order;
   * {@code select(v, 0, true)} is the minimum. See {@link #nthElement} for the details.
   *
   * @throws NullPointerException if {@code values} is null
   * @throws IndexOutOfBoundsException unless {@code 0 <= nth < values.length}
   */
  public static float select(float[] values, int nth, boolean ascending) {
    return nthElement(values, 0, nth, values.length, ascending ? 1 : 0);
  }
}
