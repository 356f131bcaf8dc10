package com.quilby.norvane.apps.clipweaver.aggregator;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.Arrays;
import java.util.Random;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;

class AlgorithmsTest {
  // Slices of random length and place, some with many ties, against a full
  // sort; the values around the slice would change answers if they took part.
  // With NaN in every third place (one round in five) any member of the slice will do.
  @Test
  void agreesWithAFullSortOnRandomSlices() {
    Random random = new Random(42);
    int[] orders = {1, 7, 0, -7};
    for (int round = 0; round < 2000; round++) {
      float[] values = new float[1 + random.nextInt(300)];
      int distinct = random.nextBoolean() ? 5 : 1 << 20;
      for (int i = 0; i < values.length; i++) values[i] = random.nextInt(distinct) - distinct / 2f;
      boolean nan = round % 5 == 4;
      for (int i = 0; nan && i < values.length; i += 3) values[i] = Float.NaN;
      int first = random.nextInt(values.length);
      int last = first + 1 + random.nextInt(values.length - first);
      int nth = first + random.nextInt(last - first);
      int order = orders[round % orders.length];
      float[] sorted = Arrays.copyOfRange(values, first, last);
      Arrays.sort(sorted);
      float expected = order > 0 ? sorted[nth - first] : sorted[last - 1 - nth];
      float[] copy = values.clone();
      float got = Algorithms.nthElement(copy, first, nth, last, order);
      if (nan) {
        assertTrue(Arrays.binarySearch(sorted, got) >= 0, "round " + round + ": " + got);
      } else {
        assertEquals(expected, got, "round " + round);
      }
      for (int i = 0; i < values.length; i++) {
        if (i < first || i >= last) assertEquals(values[i], copy[i], "outside element " + i);
      }
    }
    assertEquals(Float.NEGATIVE_INFINITY,
        Algorithms.select(new float[] {0, Float.NEGATIVE_INFINITY, -0f}, 0, true));
    assertEquals(5f, Algorithms.select(new float[] {5, 1, 4, 2, 3}, 0, false));
    assertThrows(NullPointerException.class, () -> Algorithms.nthElement(null, 0, 0, 1, 1));
  }

  @ParameterizedTest(name = "first {0}, nth {1}, last {2}")
  @CsvSource({
    "-1, 0, 3", "0, 3, 3", "0, 0, 4", "2, 1, 3", "1, 1, 1", "0, -1, 3", "2147483647, 2147483647, 3",
    "0, 0, -1", "-2147483648, 0, 3",
  })
  void indicesOutsideTheArrayThrow(int first, int nth, int last) {
    assertEquals("nthElement: first " + first + ", nth " + nth + ", last " + last
            + " outside 0 <= first <= nth < last <= length 3",
        assertThrows(IndexOutOfBoundsException.class,
            () -> Algorithms.nthElement(new float[] {1, 2, 3}, first, nth, last, 1)).getMessage());
  }
}
