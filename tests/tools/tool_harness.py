"""Shared helpers of the clipweaver end-to-end suites.

Each suite runs as: python3 SUITE.py PATH/TO/clipweaver WORK_DIR
"""
import array
import json
import os
import shutil
import subprocess
import sys
import unittest
import wave

TOOL = None
WORK = None


def main():
    global TOOL, WORK
    TOOL, WORK = sys.argv[1], sys.argv[2]
    shutil.rmtree(WORK, ignore_errors=True)
    os.makedirs(WORK)
    unittest.main(argv=sys.argv[:1] + sys.argv[3:], verbosity=2)


def path(name):
    return os.path.join(WORK, name)


def run(*args, timeout=300):
    return subprocess.run([TOOL, *map(str, args)], capture_output=True,
                          text=True, timeout=timeout, cwd=WORK)


def example(name, bpm=120, rate=44100, channels=2, seconds=20):
    """The example groove, generated once per work directory."""
    target = path(name)
    if not os.path.exists(target):
        done = run('example', target, '--bpm', bpm, '--rate', rate,
                   '--channels', channels, '--seconds', seconds)
        assert done.returncode == 0, done.stderr
    return target


def beats_json(*args):
    done = run('beats', '--format', 'json', *args)
    assert done.returncode == 0, done.stderr
    return [json.loads(line) for line in done.stdout.splitlines()]


def read_wav(name):
    """(channels, rate, interleaved 16-bit samples) of a PCM WAV file."""
    with wave.open(path(name) if not os.path.isabs(name) else name) as w:
        assert w.getsampwidth() == 2
        samples = array.array('h', w.readframes(w.getnframes()))
        return w.getnchannels(), w.getframerate(), samples.tolist()
