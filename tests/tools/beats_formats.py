"""Tempo and beats of the example groove across input and output formats."""
import statistics
import unittest

from tool_harness import beats_json, example, run


class InputAndOutputFormats(unittest.TestCase):
    # At 22,050 Hz the analysis takes 99 frames per second for a hop that
    # gives 99.77, so tempos there read up to 0.8% low; 110 BPM falls on a
    # whole number of frames and stays clear of the 1% margin.
    CASES = [
        ('f48.flac', 100, 48000, 1),
        ('f48.wav', 100, 48000, 1),
        ('w22.wav', 110, 22050, 2),
        ('o44.ogg', 90, 44100, 2),
    ]

    def test_tempo_within_one_percent_and_wav_and_flac_alike(self):
        results = beats_json(*[example(*case) for case in self.CASES])
        self.assertEqual({**results[0], 'file': ''}, {**results[1], 'file': ''})
        for (name, bpm, rate, channels), result in zip(self.CASES, results):
            with self.subTest(name):
                self.assertEqual((result['sample_rate'], result['channels'], result['duration']),
                                 (rate, channels, 20.0))
                self.assertLess(abs(result['tempo'] - bpm) / bpm, 0.01)
                steps = [b - a for a, b in zip(result['beats'], result['beats'][1:])]
                self.assertLess(abs(statistics.median(steps) - 60 / bpm), 0.02)
                self.assertGreater(min(steps), 0)

    def test_text_and_csv_show_the_json_beats(self):
        groove = example('a.wav', 120)
        [result] = beats_json(groove)
        text = run('beats', groove).stdout.splitlines()
        self.assertEqual(
            text[0], groove + ': 120.02 BPM, 40 beats in 20.00 s (44100 Hz, 2 channels)')
        self.assertTrue(all(len(line.split()) <= 8 for line in text[1:]))
        rows = run('beats', '--format', 'csv', groove).stdout.splitlines()
        self.assertEqual(rows[0], 'file,tempo_bpm,beat,time_s')
        self.assertEqual([row.split(',')[:3] for row in rows[1:]],
                         [[groove, '120.018', str(i + 1)] for i in range(40)])
        for times in ([float(t) for line in text[1:] for t in line.split()],
                      [float(row.split(',')[3]) for row in rows[1:]]):
            self.assertEqual(times, [round(b, 3) for b in result['beats']])
