"""The resample command: frame counts, rates and the samples themselves,
across the block boundaries of its streaming loop."""
import unittest

from tool_harness import example, read_wav, run


def resample(source, target, *options):
    done = run('resample', source, target, *options)
    assert done.returncode == 0, done.stderr
    return read_wav(target)


class Resample(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.stereo = example('stereo.wav', 120, 44100, 2, seconds=3)
        cls.mono = example('mono.wav', 120, 48000, 1, seconds=3)

    def test_frame_counts_and_samples_across_blocks(self):
        for source, rate, channels in [(self.stereo, 48000, 2), (self.stereo, 22050, 2),
                                       (self.mono, 44100, 1)]:
            with self.subTest(source=source, rate=rate):
                got_channels, got_rate, samples = resample(source, 'out.wav', '--rate', rate)
                self.assertEqual((got_channels, got_rate, len(samples)),
                                 (channels, rate, 3 * rate * channels))
        # Equal rates pass every frame through, one frame late, with each
        # channel's gain truncated toward zero; a third of the rate keeps
        # every third frame.
        _, _, music = read_wav(self.stereo)
        _, _, out = resample(self.stereo, 'gain.wav', '--rate', 44100,
                             '--gain', '0.5,-0.25')
        self.assertEqual(out[:2], [0, 0])
        self.assertEqual(out[2::2], [int(v * 0.5) for v in music[0:-2:2]])
        self.assertEqual(out[3::2], [int(v * -0.25) for v in music[1:-2:2]])
        _, _, music = read_wav(self.mono)
        _, _, out = resample(self.mono, 'third.wav', '--rate', 16000)
        self.assertEqual(out, [0] + music[2::3][:3 * 16000 - 1])
