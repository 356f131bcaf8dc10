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
  @ParameterizedTest(name = "nth {0}, ascending {1}: {2}")
  @CsvSource({"2, 1, 3", "2, 0, 3", "0, 1, 1", "0, 0, 5", "1, 7, 2", "1, -7, 4", "4, 1, 5"})
  void selectsFromTheWholeArray(int nth, int ascending, float expected) {
    assertEquals(expected, Algorithms.nthElement(new float[] {5, 1, 4, 2, 3}, 0, nth, 5, ascending));
  }

  @Test
  void smallSlices() {
    assertEquals(2f, Algorithms.nthElement(new float[] {2, 2, 1}, 0, 1, 3, 1));
    assertEquals(-0.5f, Algorithms.nthElement(new float[] {9, -0.5f, 9}, 1, 1, 2, 1));
    assertEquals(-0.5f, Algorithms.nthElement(new float[] {9, -0.5f, 9}, 1, 1, 2, 0));
    // Values outside the slice would change every answer if they took part.
    float[] fenced = {-100, -100, 5, 1, 4, 100, 100};
    assertEquals(1f, Algorithms.nthElement(fenced, 2, 2, 5, 1));
    assertEquals(5f, Algorithms.nthElement(fenced, 2, 2, 5, 0));
    assertEquals(4f, Algorithms.nthElement(fenced, 2, 3, 5, 1));
    assertEquals(Float.NEGATIVE_INFINITY,
        Algorithms.select(new float[] {0, Float.NEGATIVE_INFINITY, -0f}, 0, true));
  }

  @Test
  void agreesWithAFullSortOnRandomSlices() {
    Random random = new Random(42);
    for (int round = 0; round < 2000; round++) {
      float[] values = new float[1 + random.nextInt(300)];
      // Few distinct values in some rounds, to exercise ties.
      int distinct = random.nextBoolean() ? 5 : 1 << 20;
      for (int i = 0; i < values.length; i++) values[i] = random.nextInt(distinct) - distinct / 2f;
      int first = random.nextInt(values.length);
      int last = first + 1 + random.nextInt(values.length - first);
      int nth = first + random.nextInt(last - first);
      boolean ascending = random.nextBoolean();
      float[] sorted = Arrays.copyOfRange(values, first, last);
      Arrays.sort(sorted);
      float expected = ascending ? sorted[nth - first] : sorted[last - 1 - nth];
      float[] copy = values.clone();
      assertEquals(expected, Algorithms.nthElement(copy, first, nth, last, ascending ? 1 : -1),
          "round " + round);
      for (int i = 0; i < values.length; i++) {
        if (i < first || i >= last) assertEquals(values[i], copy[i], "outside element " + i);
      }
    }
  }

  @Test
  void nanGivesSomeMemberOfTheSlice() {
    float[] values = {3, Float.NaN, 1, Float.NaN, 2, 0, Float.NaN};
    for (int nth = 0; nth < values.length; nth++) {
      float result = Algorithms.nthElement(values.clone(), 0, nth, values.length, 1);
      assertTrue(Float.isNaN(result) || (result >= 0 && result <= 3 && result == (int) result));
    }
  }

  @ParameterizedTest(name = "first {0}, nth {1}, last {2}")
  @CsvSource({
    "-1, 0, 3", "0, 3, 3", "0, 0, 4", "2, 1, 3", "1, 1, 1", "0, -1, 3", "2147483647, 2147483647, 3",
    "0, 0, -1", "-2147483648, 0, 3",
  })
  void indicesOutsideTheArrayThrow(int first, int nth, int last) {
    IndexOutOfBoundsException e = assertThrows(IndexOutOfBoundsException.class,
        () -> Algorithms.nthElement(new float[] {1, 2, 3}, first, nth, last, 1));
    String message = e.getMessage();
    assertTrue(message.contains("first " + first) && message.contains("nth " + nth)
        && message.contains("last " + last) && message.contains("length 3"), message);
    assertThrows(IndexOutOfBoundsException.class, () -> Algorithms.select(new float[0], 0, true));
  }

  @Test
  void nullArrayThrows() {
    assertThrows(NullPointerException.class, () -> Algorithms.nthElement(null, 0, 0, 1, 1));
  }
}
