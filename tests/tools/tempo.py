"""The tempo the tool reports, --tempo MIN-MAX, and beat times at the true frame rate."""
import unittest

from tool_harness import beats_json, example


class Tempo(unittest.TestCase):
    def test_a_range_moves_the_tracker_to_the_true_metrical_level(self):
        # (groove BPM, what the default finds, arguments with the range)
        for bpm, default, args in [
                (60, 120, ['--tempo', '50-80', '{}']),
                (60, 120, ['{}', '--tempo=50-80']),
                (180, 120, ['{}', '--tempo', '150-210'])]:
            groove = example('groove%d.wav' % bpm, bpm, seconds=30)
            [plain] = beats_json(groove)
            [ranged] = beats_json(*[groove if a == '{}' else a for a in args])
            with self.subTest(bpm=bpm, args=args):
                self.assertAlmostEqual(plain['tempo'], default, delta=0.005 * default)
                self.assertAlmostEqual(ranged['tempo'], bpm, delta=0.005 * bpm)
                # The tracker's figure stays in whole frames.
                self.assertAlmostEqual(ranged['tracker_tempo'],
                                       6000 / round(6000 / bpm), places=3)

    def test_beats_lie_on_the_true_grid_at_rates_the_step_does_not_divide(self):
        # (rate, seconds): 221 and 110 samples a step, 99.77 and 100.23 frames
        # a second, counted as 99 and 100 by the library.
        for rate, seconds, step in [(22050, 180, 221), (11025, 60, 110)]:
            groove = example('groove%d.wav' % rate, 120, rate, 1, seconds)
            [result] = beats_json(groove)
            beats = result['beats']
            frame = step / rate
            off_grid = [t - 0.5 * round(t / 0.5) for t in beats]
            with self.subTest(rate=rate):
                self.assertGreater(len(beats), 1.9 * seconds)
                # Whole-frame periods let the beats wander a few frames about
                # the grid; counted at 99 frames a second they would drift
                # off it by 7.8 ms a second.
                self.assertLessEqual(max(map(abs, off_grid)), 4 * frame)
                self.assertLessEqual(abs(sum(off_grid) / len(beats)), frame)
                self.assertLess(beats[-1], seconds)
                self.assertAlmostEqual(result['tempo'], 120, delta=0.06)
