"""Unusable input: one clear line per file, the other files still run, and
the exit status tells."""
import json
import os
import unittest
import wave

from tool_harness import example, main, path, run


def write_file(name, data):
    with open(path(name), 'wb') as f:
        f.write(data)
    return path(name)


def silent_wav(name, frames):
    with wave.open(path(name), 'wb') as w:
        w.setnchannels(1)
        w.setsampwidth(2)
        w.setframerate(44100)
        w.writeframes(b'\0\0' * frames)
    return path(name)


class BadInput(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        os.makedirs(path('folder.wav'), exist_ok=True)
        cls.cases = [
            (path('missing.wav'), 'no such file'),
            (write_file('notes.wav', b'just some text\n' * 20),
             'unsupported format (not a sound file libsndfile can decode)'),
            (write_file('empty.flac', b''), 'no audio (the file is empty)'),
            (silent_wav('no-frames.wav', 0),
             'no audio (the file holds no samples)'),
            (example('blip.wav', seconds=0.5),
             'too short to analyse (0.50 s; at least 1.00 s needed)'),
            (path('folder.wav'), 'is a directory, not a sound file'),
        ]
        cls.good = example('good.wav')

    def test_each_case_names_the_file_and_the_reason(self):
        for bad, reason in self.cases:
            with self.subTest(os.path.basename(bad)):
                done = run('beats', bad)
                self.assertEqual(done.returncode, 1)
                self.assertEqual(done.stderr, f'clipweaver: {bad}: {reason}\n')
                self.assertEqual(done.stdout, '')

    def test_good_files_among_bad_ones_still_get_their_beats(self):
        files = [bad for bad, _ in self.cases]
        files.insert(3, self.good)
        done = run('beats', '-j3', *files)
        self.assertEqual(done.returncode, 1)
        self.assertTrue(done.stdout.startswith(self.good + ': 120.02 BPM'))
        self.assertEqual(done.stderr.splitlines(),
                         [f'clipweaver: {bad}: {reason}'
                          for bad, reason in self.cases])

    def test_json_has_an_error_object_in_place_of_each_bad_file(self):
        missing, reason = self.cases[0]
        done = run('beats', '--format', 'json', missing, self.good)
        self.assertEqual(done.returncode, 1)
        first, second = map(json.loads, done.stdout.splitlines())
        self.assertEqual(first, {'file': missing, 'error': reason})
        self.assertEqual((second['tempo'], second['tracker_tempo']), (120.018, 120.0))

    @unittest.skipIf(os.geteuid() == 0, 'root reads any file')
    def test_unreadable_file(self):
        locked = example('locked.wav')
        os.chmod(locked, 0)
        try:
            done = run('beats', locked)
        finally:
            os.chmod(locked, 0o644)
        self.assertEqual(done.returncode, 1)
        self.assertEqual(done.stderr,
                         f'clipweaver: {locked}: unreadable: permission denied\n')

    def test_silence_is_analysed_but_has_no_tempo(self):
        quiet = silent_wav('silence.wav', 3 * 44100)
        done = run('beats', '--format', 'json', quiet)
        self.assertEqual(done.returncode, 0, done.stderr)
        result = json.loads(done.stdout)
        self.assertIsNone(result['tempo'])
        self.assertEqual(result['beats'], [])


class BadCommandLine(unittest.TestCase):
    def test_usage_errors_exit_with_2_and_say_what_is_wrong(self):
        good = example('good.wav')
        cases = [
            ((), 'no command given'),
            (('analyse', good), "unknown command 'analyse'"),
            (('beats',), 'beats needs at least one FILE'),
            (('beats', '--format', 'xml', good),
             "--format 'xml' is not one of text, csv, json"),
            (('beats', '-j', '0', good), "--jobs '0' is not a number from 1 to 1024"),
            (('beats', '--colour', good), "unknown option '--colour'"),
            (('beats', good, good, '--click', 'out.wav'),
             "--click with several files needs '{}' in its name, e.g. '{}.click.wav'"),
            (('beats', good, 'x/good.flac', '--plot', '{}.svg'),
             "--plot '{}.svg' gives the same name 'good.svg' to two inputs"),
            (('resample', good, 'out.wav'), 'resample needs --rate HZ'),
            (('resample', good, 'out.wav', '--rate', '48k'),
             "--rate '48k' is not a sample rate in Hz (1000 to 768000)"),
            (('resample', good, 'out.wav', '--rate', '48000', '--gain', '2,1'),
             "--gain '2,1' is not L,R with both gains from -1 to 1"),
            (('example', 'x.wav', '--channels', '3'), "--channels '3' is not 1 or 2"),
            (('example', 'x.wav', '--seconds', '0'),
             "--seconds '0' is not a duration from 0 to 3600"),
        ]
        for args, message in cases:
            with self.subTest(args):
                done = run(*args)
                self.assertEqual(done.returncode, 2)
                self.assertEqual(done.stderr,
                                 f'clipweaver: {message} (see clipweaver --help)\n')


if __name__ == '__main__':
    main()
