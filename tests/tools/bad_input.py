"""Refusals: unusable files and command lines, and outputs that would
destroy data. Each gives its exit status and one line, changes nothing on
disk, and leaves the other files of a run their results."""
import json
import os
import unittest

from tool_harness import example, path, run, silent_wav, snapshot


class Refusals(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        example('a.wav', seconds=3)
        example('b.wav', 100, seconds=3)
        example('slow.wav', 120, 22050, 1, seconds=3)
        example('blip.wav', seconds=0.5)
        os.link(path('a.wav'), path('a-hard.wav'))
        os.symlink('a.wav', path('a-link.wav'))
        os.makedirs(path('sub/folder.wav'))
        os.mkfifo(path('pipe.wav'))
        for name, text in (('notes.wav', b'just some text\n' * 20), ('empty.flac', b'')):
            with open(path(name), 'wb') as f:
                f.write(text)
        silent_wav('no-frames.wav', 0)
        silent_wav('silence.wav', 3)

    # (arguments, exit status, the line after 'clipweaver: ')
    USAGE = ' (see clipweaver --help)'
    SAME = 'is the same file as'
    FORMATS = 'unknown output format (use .wav, .flac, .ogg, .aiff or .au)'
    CASES = [
        ((), 2, 'no command given' + USAGE),
        (('analyse', 'a.wav'), 2, "unknown command 'analyse'" + USAGE),
        (('beats',), 2, 'beats needs at least one FILE' + USAGE),
        (('beats', '--format', 'xml', 'a.wav'), 2,
         "--format 'xml' is not one of text, csv, json" + USAGE),
        (('beats', '-j', '0', 'a.wav'), 2, "--jobs '0' is not a number from 1 to 1024" + USAGE),
        (('beats', 'a.wav', '-j'), 2, '-j needs a value' + USAGE),
        (('beats', '--colour', 'a.wav'), 2, "unknown option '--colour'" + USAGE),
        (('beats', '--quiet=yes', 'a.wav'), 2, '--quiet takes no value' + USAGE),
        (('beats', 'a.wav', 'b.wav', '--click', 'out.wav'), 2,
         "--click with several files needs '{}' in its name, e.g. '{}.click.wav'" + USAGE),
        (('beats', 'a.wav', 'sub/a.wav', '--plot', '{}.svg'), 2,
         "--plot '{}.svg' gives the same name 'a.svg' to two inputs" + USAGE),
        (('beats', 'a.wav', 'b.wav', '--html', 'page.html'), 2,
         "--html with several files needs '{}' in its name, e.g. '{}.html'" + USAGE),
        (('beats', 'a.wav', '--click', 'a.mp3'), 2, f"--click 'a.mp3': {FORMATS}" + USAGE),
        (('beats', 'a.wav', '--plot', 'a.png'), 2, "--plot 'a.png' does not end in .svg" + USAGE),
        (('resample', 'a.wav', 'out.wav'), 2, 'resample needs --rate HZ' + USAGE),
        (('resample', 'a.wav', 'out.wav', '--rate', '48k'), 2,
         "--rate '48k' is not a sample rate in Hz (1000 to 768000)" + USAGE),
        (('resample', 'a.wav', 'out.wav', '--rate', '48000', '--gain', '2,1'), 2,
         "--gain '2,1' is not L,R with both gains from -1 to 1" + USAGE),
        (('resample', 'a.wav', 'out.mp4', '--rate', '48000'), 2, f'out.mp4: {FORMATS}' + USAGE),
        (('example', 'x.wav', '--channels', '3'), 2, "--channels '3' is not 1 or 2" + USAGE),
        (('example', 'x.wav', '--seconds', '0'), 2,
         "--seconds '0' is not a duration from 0 to 3600" + USAGE),
        # Tempo ranges, refused before any analysis, naming the first file
        # that cannot take one.
        (('beats', '--tempo', 'nan-180', 'a.wav'), 2, 'tempo range NaN-180 BPM is not a range: '
         'both ends must be numbers within 30-1200 BPM' + USAGE),
        (('beats', '--tempo', '180-170', 'a.wav'), 2, 'tempo range 180-170 BPM is empty: '
         'the minimum must be below the maximum' + USAGE),
        (('beats', '--tempo', '20-80', 'a.wav'), 2,
         'tempo range 20-80 BPM is outside 30-1200 BPM' + USAGE),
        (('beats', '--tempo', 'fast', 'a.wav'), 2,
         "--tempo 'fast' is not MIN-MAX in BPM, e.g. 150-200" + USAGE),
        (('beats', '--tempo', '1000-1200', 'a.wav', 'slow.wav'), 2, 'a.wav: tempo range '
         '1000-1200 BPM is too narrow: at 100 frames per second it holds 2 beat periods, '
         '3 are needed'),
        (('beats', '--tempo', '1000-1200', 'slow.wav', 'a.wav'), 2, 'slow.wav: tempo range '
         '1000-1200 BPM is too narrow: at 99 frames per second it holds 2 beat periods, '
         '3 are needed'),
        (('beats', '--tempo', '800-1200', 'a.wav'), 2, 'a.wav: tempo range 800-1200 BPM '
         'is too narrow: at 100 frames per second it holds 26 tracker states, 100 are needed'),
        # Outputs onto inputs, however they are named.
        (('resample', 'a.wav', 'a.wav', '--rate', 48000), 2,
         f"output 'a.wav' {SAME} input 'a.wav'; nothing written"),
        (('resample', 'a.wav', 'a-hard.wav', '--rate', 48000), 2,
         f"output 'a-hard.wav' {SAME} input 'a.wav'; nothing written"),
        (('resample', 'a.wav', 'sub/../a-link.wav', '--rate', 48000), 2,
         f"output 'sub/../a-link.wav' {SAME} input 'a.wav'; nothing written"),
        (('beats', 'a.wav', 'b.wav', '--click', '{}.wav'), 2,
         f"--click output 'a.wav' {SAME} input 'a.wav'; nothing written"),
        (('beats', 'a.wav', 'b.wav', '--click', 'sub/../{}.wav'), 2,
         f"--click output 'sub/../a.wav' {SAME} input 'a.wav'; nothing written"),
        # Outputs the format or the target cannot take. 11 GB of samples is
        # past what AIFF's 32-bit sizes hold.
        (('example', 'big.aiff', '--seconds', 3600, '--rate', 768000), 1,
         'big.aiff: cannot write: too long for .aiff (it holds at most '
         '1398.10 s at this rate and channel count); use .wav, .flac or .ogg'),
        (('resample', 'a.wav', 'no/dir/out.wav', '--rate', 48000), 1,
         'no/dir/out.wav: cannot write: no such directory'),
        (('resample', 'a.wav', 'pipe.wav', '--rate', 48000), 1,
         'pipe.wav: cannot write: exists and is not a regular file'),
        # Unusable inputs.
        (('beats', 'missing.wav'), 1, 'missing.wav: no such file'),
        (('beats', 'notes.wav'), 1,
         'notes.wav: unsupported format (not a sound file libsndfile can decode)'),
        (('beats', 'empty.flac'), 1, 'empty.flac: no audio (the file is empty)'),
        (('beats', 'no-frames.wav'), 1, 'no-frames.wav: no audio (the file holds no samples)'),
        (('beats', 'blip.wav'), 1,
         'blip.wav: too short to analyse (0.50 s; at least 1.00 s needed)'),
        (('beats', 'sub/folder.wav'), 1, 'sub/folder.wav: is a directory, not a sound file'),
        (('beats', 'pipe.wav'), 1,
         'pipe.wav: is a named pipe, not a regular file (sound files are read with seeks)'),
        (('resample', 'a.wav', 'low.wav', '--rate', 8000), 1,
         'a.wav: 44100 Hz to 8000 Hz is more than the 3:1 reduction the resampler allows'),
    ]

    def test_each_refusal_is_one_line_and_changes_nothing(self):
        before = snapshot()
        for args, status, message in self.CASES:
            with self.subTest(args):
                done = run(*args, timeout=20)
                self.assertEqual((done.returncode, done.stderr, done.stdout),
                                 (status, f'clipweaver: {message}\n', ''))
                self.assertEqual(snapshot(), before)

    @unittest.skipIf(os.geteuid() == 0, 'root reads any file')
    def test_unreadable_file(self):
        os.chmod(path('b.wav'), 0)
        try:
            done = run('beats', 'b.wav')
        finally:
            os.chmod(path('b.wav'), 0o644)
        self.assertEqual(done.stderr, 'clipweaver: b.wav: unreadable: permission denied\n')

    def test_good_files_among_bad_ones_get_their_beats_in_argument_order(self):
        bad = [args[1] for args, status, _ in self.CASES
               if status == 1 and args[0] == 'beats']
        files = bad[:3] + ['a.wav', 'b.wav', 'silence.wav'] + bad[3:]
        done = run('beats', '-j3', '--format', 'json', *files)
        self.assertEqual(done.returncode, 1)
        self.assertEqual(done.stdout, run('beats', '-j1', '--format', 'json', *files).stdout)
        results = [json.loads(line) for line in done.stdout.splitlines()]
        self.assertEqual([r['file'] for r in results], files)
        self.assertEqual(set(results[3]), {'file', 'duration', 'sample_rate', 'channels',
                                           'tempo', 'tracker_tempo', 'beats'})
        self.assertEqual((results[3]['tempo'], results[3]['tracker_tempo']), (120.0, 120.0))
        # Silence is analysed but has no tempo.
        self.assertEqual((results[5]['tempo'], results[5]['beats']), (None, []))
        self.assertEqual(results[0], {'file': 'missing.wav', 'error': 'no such file'})
        self.assertEqual(len(done.stderr.splitlines()), len(bad))
