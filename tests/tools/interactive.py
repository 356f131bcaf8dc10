"""What a person at a terminal sees: help, version and the progress bar."""
import os
import pty
import re
import subprocess
import unittest

import tool_harness
from tool_harness import example, run


def run_on_terminal(*args):
    """What the tool's stderr shows on a pseudo-terminal, and its exit status."""
    controller, terminal = pty.openpty()
    process = subprocess.Popen([tool_harness.TOOL, *args], stdout=subprocess.DEVNULL,
                               stderr=terminal, cwd=tool_harness.WORK)
    os.close(terminal)
    received = b''
    try:
        while chunk := os.read(controller, 65536):
            received += chunk
    except OSError:  # the terminal closes with the process
        pass
    os.close(controller)
    return received.decode(), process.wait()


class Terminal(unittest.TestCase):
    def test_help_lists_every_option_with_examples_and_version_is_one_line(self):
        for args in (('--help',), ('beats', '--help'), ('example', '-h')):
            with self.subTest(args):
                done = run(*args)
                self.assertEqual(done.returncode, 0)
                for option in ('format jobs quiet verbose tempo click plot html rate gain bpm '
                               'seconds channels version').split():
                    self.assertIn('--' + option, done.stdout)
                self.assertIn('\nExamples:\n  clipweaver ', done.stdout)
        self.assertRegex(run('--version').stdout, r'^clipweaver \d+\.\d+\.\d+\n$')

    def test_drawn_up_to_100_percent_one_row_per_worker_erased_unless_quiet_or_verbose(self):
        groove = example('groove.wav')
        shown, status = run_on_terminal('beats', groove)
        self.assertEqual(status, 0)
        percents = [int(p) for p in re.findall(r'\] +(\d+)%', shown)]
        self.assertEqual((percents[0], percents[-1], percents), (0, 100, sorted(percents)))
        self.assertIn('groove.wav', shown)
        self.assertTrue(shown.endswith('\x1b[J'))
        self.assertEqual(run_on_terminal('beats', '--quiet', groove), ('', 0))
        shown, _ = run_on_terminal('beats', '--verbose', groove)
        self.assertNotIn('%', shown)
        self.assertIn('native : ', shown)
        # One row per worker, redrawn together: the cursor goes up two lines.
        shown, status = run_on_terminal('beats', '-j2', *[groove, example('other.wav', 100)] * 2)
        self.assertEqual(status, 0)
        self.assertIn('\x1b[2A', shown)
        self.assertNotIn('\x1b[3A', shown)
