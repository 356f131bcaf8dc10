"""Nothing lost (the refusals are in bad_input): Ctrl-C in every phase
leaves every file as it was, memory stays bounded whatever the ratio, and
what a file's header hides or its name holds is told plainly."""
import os
import shutil
import signal
import subprocess
import time
import unittest

import tool_harness
from tool_harness import example, path, read_wav, run, silent_wav, snapshot


def start(*args):
    return subprocess.Popen([tool_harness.TOOL, *map(str, args)], stdout=subprocess.PIPE,
                            stderr=subprocess.PIPE, text=True, cwd=tool_harness.WORK,
                            preexec_fn=tool_harness.limits())


def partial(prefix, header):
    """Waits until the hidden temporary file of an output in the works holds
    its first bytes, and checks them."""
    def ready(process):
        deadline = time.monotonic() + 30
        while time.monotonic() < deadline:
            for name in os.listdir(path('.')):
                if name.startswith('.' + prefix) and os.path.getsize(path(name)) >= 4:
                    with open(path(name), 'rb') as f:
                        assert f.read(4) == header, prefix
                    return
            time.sleep(0.01)
        raise AssertionError(f'no temporary file for {prefix}')
    return ready


class DataSafety(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        example('a.wav', seconds=3)
        os.makedirs(path('sub'))
        silent_wav('kept.wav', 1)
        # 5 frames at 1 Hz: upsampled to 768 kHz, 3.84 million frames.
        silent_wav('one-hertz.wav', 5, rate=1)
        example('slow.wav', 120, 8000, 1, seconds=1200)

    def test_one_hertz_to_768_khz_runs_in_bounded_memory(self):
        done = run('resample', 'one-hertz.wav', 'up.wav', '--rate', 768000,
                   memory=256 << 20, timeout=60)
        self.assertEqual(done.returncode, 0, done.stderr)
        channels, rate, samples = read_wav('up.wav')
        self.assertEqual((channels, rate, len(samples)), (1, 768000, 5 * 768000))

    def test_ctrl_c_in_any_phase_leaves_nothing_and_says_what_stopped(self):
        def first_result(process):
            self.assertIn('a.wav: 120.00 BPM', process.stdout.readline())

        # (arguments, when to press Ctrl-C, last line, what sub/ holds then)
        cases = [
            # 4.6 GB of samples: the WAV goes out as RF64 from its first byte.
            (('example', 'huge.wav', '--seconds', 1500, '--rate', 768000),
             partial('huge.wav', b'RF64'),
             'writing of huge.wav stopped; nothing written', []),
            (('resample', 'slow.wav', 'kept.wav', '--rate', 768000),
             partial('kept.wav', b'RIFF'),
             'resampling of slow.wav stopped; nothing written', []),
            (('beats', '-q', 'slow.wav', '--click', 'clicks.wav'),
             partial('clicks.wav', b'RIFF'), 'analysis of slow.wav stopped; '
             '0 of 1 files done, no output left from the others', []),
            (('beats', '-q', '-j1', 'a.wav', 'slow.wav', '--plot', 'sub/{}.svg'),
             first_result, 'analysis of slow.wav stopped; '
             '1 of 2 files done, no output left from the others', ['a.svg']),
        ]
        for args, ready, message, kept_in_sub in cases:
            with self.subTest(args):
                before = snapshot()
                process = start(*args)
                ready(process)
                process.send_signal(signal.SIGINT)
                _, errors = process.communicate(timeout=20)
                self.assertEqual(process.returncode, 130)
                self.assertEqual(errors, f'clipweaver: interrupted: {message}\n')
                after = snapshot()
                self.assertEqual(os.listdir(path('sub')), kept_in_sub)
                self.assertEqual({f: d for f, d in after.items() if f.split('/')[0] != 'sub'},
                                 {f: d for f, d in before.items() if f.split('/')[0] != 'sub'})

    def test_outputs_past_the_file_size_limit_are_refused_and_left_out(self):
        example('groove.wav')
        # The plot (94 kB) fails after a first buffered write went through.
        for option, name in (('--plot', 'big.svg'), ('--html', 'big.html'),
                             ('--click', 'big.wav')):
            with self.subTest(option):
                before = snapshot()
                done = run('beats', 'groove.wav', option, name, timeout=60, file_size=80_000)
                self.assertEqual((done.returncode, done.stderr), (1, (
                    f'clipweaver: groove.wav: {name}: cannot write: '
                    'file too large for this file system\n')))
                self.assertTrue(done.stdout.startswith('groove.wav: 120.02 BPM'))
                self.assertEqual(snapshot(), before)

    def test_truncation_is_told_and_control_characters_in_names_are_escaped(self):
        name = 'x\ny\r\x1b[31m\x9b.wav'
        shutil.copy(example('ten.wav', seconds=10, channels=1), path(name))
        os.truncate(path(name), 44 + 2 * 147000)
        done = run('beats', name)
        self.assertEqual(done.returncode, 0)
        escaped = 'x\\ny\\r\\x1B[31m\\xC2\\x9B.wav'
        self.assertTrue(done.stdout.startswith(f'{escaped}: 120.00 BPM, 7 beats in 3.33 s'))
        self.assertEqual(done.stderr, f'clipweaver: {escaped}: warning: truncated: 3.33 s '
                         'present of 10.00 s announced; analysed what is there\n')
