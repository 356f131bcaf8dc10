"""The click track and the plot written next to the beats."""
import json
import os
import re
import unittest
import xml.etree.ElementTree as ElementTree

from tool_harness import beats_json, example, path, read_wav

SVG = '{http://www.w3.org/2000/svg}'


class ClickTrackAndPlot(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.groove, cls.other = example('groove.wav'), example('other.flac', 100, 48000, 1)
        os.makedirs(path('plots'))
        [cls.result, _] = beats_json(cls.groove, cls.other, '--click', '{}.click.wav',
                                     '--plot', '{}.svg', '--html', 'plots/{}.html')

    def test_plot_shows_every_beat_in_its_row_of_ten_seconds(self):
        [fast] = beats_json(example('fast.wav', 150, seconds=25), '--plot', 'fast.svg')
        for svg, result, rows, bpm in (('groove.svg', self.result, 2, '120.0 BPM'),
                                       ('fast.svg', fast, 3, '150.0 BPM')):
            with self.subTest(svg):
                root = ElementTree.parse(path(svg)).getroot()
                self.assertIn(bpm, ''.join(root.find(SVG + 'text').itertext()))
                overview = root.find(f"{SVG}g[@class='overview']")
                self.assertEqual(len(overview.findall(f"{SVG}g[@class='beats']/{SVG}line")),
                                 len(result['beats']))
                found = []
                row_groups = root.findall(f"{SVG}g[@class='row']")
                self.assertEqual(len(row_groups), rows)
                for index, row in enumerate(row_groups):
                    # The time labels give the row's scale.
                    labels = [(float(t.get('x')), float(t.text))
                              for t in row.findall(f"{SVG}g[@class='axis']/{SVG}text")]
                    (x0, t0), (x1, t1) = labels[0], labels[-1]
                    self.assertEqual(t0, 10 * index)
                    xs = [float(m.get('x1'))
                          for m in row.findall(f"{SVG}g[@class='beats']/{SVG}line")]
                    # Distinct marks: several pixels between neighbours.
                    self.assertTrue(all(b - a > 20 for a, b in zip(xs, xs[1:])), xs)
                    found += [t0 + (x - x0) * (t1 - t0) / (x1 - x0) for x in xs]
                    self.assertIsNotNone(row.find(f"{SVG}path[@class='wave']"))
                    self.assertIsNotNone(row.find(f"{SVG}polyline[@class='onset']"))
                self.assertEqual(len(found), len(result['beats']))
                for got, want in zip(found, result['beats']):
                    self.assertAlmostEqual(got, want, delta=0.002)

    def test_click_track_is_the_music_with_a_burst_at_each_beat(self):
        channels, rate, music = read_wav(self.groove)
        click_channels, click_rate, clicks = read_wav('groove.click.wav')
        self.assertEqual((click_channels, click_rate, len(clicks)),
                         (channels, rate, len(music)))
        starts = {round(b * rate) for b in self.result['beats']}
        burst = int(0.02 * rate) + 1

        def deviation(frame):
            return max(abs(clicks[frame * channels + c] -
                           0.6 * music[frame * channels + c])
                       for c in range(channels))

        for start in sorted(starts):
            self.assertGreater(max(deviation(f) for f in
                                   range(start, min(start + burst, len(music) // channels))),
                               4000)
        # Away from the clicks the music is only scaled.
        near = {f for s in starts for f in range(s, s + burst)}
        for frame in range(0, len(music) // channels, 97):
            if frame not in near:
                self.assertLessEqual(deviation(frame), 1.0)

    def test_several_files_fill_in_the_name_pattern(self):
        for name, source in (('groove', self.groove), ('other', self.other)):
            ElementTree.parse(path(f'{name}.svg'))
            with open(path(f'plots/{name}.html'), encoding='utf-8') as page:
                data = re.search(r'id="clipweaver-data">(.*?)</script>', page.read()).group(1)
                self.assertEqual(json.loads(data)['file'], source)
