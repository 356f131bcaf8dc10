"""The click track and the plot written next to the beats."""
import json
import os
import re
import unittest
import xml.etree.ElementTree as ElementTree

from tool_harness import example, main, path, read_wav, run

SVG = '{http://www.w3.org/2000/svg}'


class ClickTrackAndPlot(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.groove = example('groove.wav')
        done = run('beats', '--format', 'json', cls.groove,
                   '--click', 'clicks.wav', '--plot', 'groove.svg')
        assert done.returncode == 0, done.stderr
        cls.result = json.loads(done.stdout)

    def test_plot_is_svg_with_a_marker_per_beat_and_the_tempo(self):
        root = ElementTree.parse(path('groove.svg')).getroot()
        self.assertEqual(root.tag, SVG + 'svg')
        width, height = (float(root.get(k)) for k in ('width', 'height'))
        title = ''.join(root.find(SVG + 'text').itertext())
        self.assertIn('120.0 BPM', title)
        markers = root.findall(f"{SVG}g[@class='beats']/{SVG}line")
        self.assertEqual(len(markers), len(self.result['beats']))
        # Markers sit in time order across the plot, from its left edge.
        xs = [float(m.get('x1')) for m in markers]
        self.assertEqual(xs, sorted(xs))
        self.assertLess(xs[-1], width)
        onset = root.find(f"{SVG}polyline[@class='onset']")
        points = [tuple(map(float, p.split(',')))
                  for p in onset.get('points').split()]
        self.assertGreater(len(points), 500)
        self.assertTrue(all(0 <= x <= width and 0 <= y <= height
                            for x, y in points))
        wave_path = root.find(f"{SVG}path[@class='wave']").get('d')
        coords = [float(v) for v in re.findall(r'-?\d+(?:\.\d+)?', wave_path)]
        self.assertTrue(all(0 <= v <= width for v in coords))

    def test_click_track_is_the_music_with_a_burst_at_each_beat(self):
        channels, rate, music = read_wav(self.groove)
        click_channels, click_rate, clicks = read_wav('clicks.wav')
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
        other = example('other.flac', 100, 48000, 1)
        os.makedirs(path('plots'), exist_ok=True)
        done = run('beats', '-q', self.groove, other, '--plot', 'plots/{}.svg')
        self.assertEqual(done.returncode, 0, done.stderr)
        for name in ('groove', 'other'):
            ElementTree.parse(path(f'plots/{name}.svg'))

    def test_an_output_that_cannot_be_written_fails_the_file_not_its_beats(self):
        done = run('beats', self.groove, '--plot', 'no/such/dir/x.svg')
        self.assertEqual(done.returncode, 1)
        self.assertTrue(done.stdout.startswith(self.groove + ': 120.02 BPM'))
        self.assertEqual(done.stderr, f'clipweaver: {self.groove}: no/such/dir/x.svg: '
                                      'cannot write: No such file or directory\n')


if __name__ == '__main__':
    main()
