"""Runs a command with its output discarded and appends "NAME user system
peak-KiB" to a file: CPU seconds to the microsecond from the kernel's
accounting of the child (where /usr/bin/time rounds to 10 ms, a twentieth of
a whole analysis), and the peak resident set as /usr/bin/time, a small
program, sees it (a child of Python would count Python's own pages).

usage: run_timed.py NAME FILE COMMAND [ARG...]
"""
import os
import subprocess
import sys
import tempfile

name, path, command = sys.argv[1], sys.argv[2], sys.argv[3:]
with tempfile.NamedTemporaryFile("r") as peak:
    child = subprocess.Popen(["/usr/bin/time", "-f", "%M", "-o", peak.name] + command,
                             stdout=subprocess.DEVNULL)
    _, status, usage = os.wait4(child.pid, 0)
    if os.waitstatus_to_exitcode(status) != 0:
        sys.exit(f"{command[0]} failed")
    peak_kib = int(peak.read().split()[-1])
with open(path, "a") as f:
    f.write(f"{name} {usage.ru_utime:.6f} {usage.ru_stime:.6f} {peak_kib}\n")
