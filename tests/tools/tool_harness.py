"""Shared helpers of the clipweaver end-to-end suites, and their runner:
python3 tool_harness.py SUITE PATH/TO/clipweaver WORK_DIR [unittest arguments]
"""
import array
import hashlib
import json
import os
import resource
import shutil
import signal
import subprocess
import sys
import unittest
import wave

TOOL = None
WORK = None


def path(name):
    return os.path.join(WORK, name)


# Every run is bounded in address space as well as in time, so that a
# buffer sized from the input fails the test rather than the machine.
MEMORY_LIMIT = 1 << 30


def limits(memory=MEMORY_LIMIT, file_size=None):
    def apply():
        resource.setrlimit(resource.RLIMIT_AS, (memory, memory))
        if file_size is not None:  # writes past it then fail instead of killing the tool
            signal.signal(signal.SIGXFSZ, signal.SIG_IGN)
            resource.setrlimit(resource.RLIMIT_FSIZE, (file_size, file_size))
    return apply


def run(*args, timeout=300, memory=MEMORY_LIMIT, file_size=None):
    return subprocess.run([TOOL, *map(str, args)], capture_output=True,
                          text=True, timeout=timeout, cwd=WORK,
                          preexec_fn=limits(memory, file_size))


def example(name, bpm=120, rate=44100, channels=2, seconds=20):
    """The example groove, generated once per work directory."""
    target = path(name)
    if not os.path.exists(target):
        done = run('example', target, '--bpm', bpm, '--rate', rate,
                   '--channels', channels, '--seconds', seconds)
        assert done.returncode == 0, done.stderr
    return target


def snapshot():
    files = {}
    for root, _, names in os.walk(WORK):
        for name in names:
            full = os.path.join(root, name)
            if os.path.isfile(full) and not os.path.islink(full):
                with open(full, 'rb') as f:
                    files[os.path.relpath(full, WORK)] = hashlib.sha256(f.read()).hexdigest()
    return files


def silent_wav(name, seconds, rate=44100):
    with wave.open(path(name), 'wb') as w:
        w.setnchannels(1)
        w.setsampwidth(2)
        w.setframerate(rate)
        w.writeframes(b'\0\0' * int(seconds * rate))
    return path(name)


def beats_json(*args):
    done = run('beats', '--format', 'json', *args)
    assert done.returncode == 0, done.stderr
    return [json.loads(line) for line in done.stdout.splitlines()]


def read_wav(name):
    """(channels, rate, interleaved 16-bit samples) of a PCM WAV file."""
    with wave.open(path(name)) as w:  # an absolute name stays as it is
        assert w.getsampwidth() == 2
        samples = array.array('h', w.readframes(w.getnframes()))
        return w.getnchannels(), w.getframerate(), samples.tolist()


if __name__ == '__main__':
    # The suites import this file as tool_harness, not as __main__.
    import tool_harness
    suite, tool_harness.TOOL, tool_harness.WORK = sys.argv[1:4]
    shutil.rmtree(tool_harness.WORK, ignore_errors=True)
    os.makedirs(tool_harness.WORK)
    unittest.main(module=suite, argv=[suite] + sys.argv[4:], verbosity=2)
