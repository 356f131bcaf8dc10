"""Writes the fuzzers' seed corpora: small, valid inputs of each kind."""
import math
import os
import struct
import sys

out = sys.argv[1]


def write(fuzzer, name, data):
    os.makedirs(os.path.join(out, fuzzer), exist_ok=True)
    with open(os.path.join(out, fuzzer, name), "wb") as f:
        f.write(data)


def pulse(rate, seconds, channels, period):
    frames = []
    for i in range(int(rate * seconds)):
        t = i / rate
        since = math.fmod(t, period)
        v = int(12000 * math.exp(-since * 30) * math.sin(2 * math.pi * 80 * since))
        frames.append(struct.pack("<h", v) * channels)
    return b"".join(frames)


# Beat analysis: rate (int32), channels (int8), cancel byte, PCM.
for rate, channels, seconds in [(8000, 1, 2.0), (4000, 2, 3.0), (200, 1, 8.0), (44100, 1, 0.2)]:
    header = struct.pack("<iBB", rate, channels, 99)
    write("beat_analysis_fuzzer", f"pulse_{rate}_{channels}",
          header + pulse(rate, seconds, channels, 0.5))
write("beat_analysis_fuzzer", "silence", struct.pack("<iBB", 8000, 1, 99) + bytes(4000))
write("beat_analysis_fuzzer", "cancel_onsets", struct.pack("<iBB", 8000, 1, 33) + pulse(8000, 1.0, 1, 0.25))

# Spectrogram: window/3 (int8), step (int8), piece seed, samples.
for window, step in [(10, 5), (1, 1), (40, 100), (127, 3)]:
    write("spectrogram_fuzzer", f"w{window}_s{step}",
          bytes([window & 0xFF, step & 0xFF, 7, 1]) + pulse(2000, 0.5, 1, 0.1))

# Selection: first, last, nth, order bytes, then float32 values.
write("selection_fuzzer", "small", bytes([0, 4, 2, 1]) + struct.pack("<5f", 5, 1, 4, 2, 3))
write("selection_fuzzer", "descending", bytes([1, 9, 3, 0x80]) + struct.pack("<12f", *range(12)))

# Resampler: depth, channels, rate (big-endian), stereo flag, then calls.
for channels, rate, stereo in [(1, 48000, 0), (2, 44100, 0), (1, 48000, 1)]:
    calls = bytes([1]) + struct.pack(">i", 44100) + bytes([3]) + struct.pack(">H", 441) + bytes(882 * channels)
    calls += bytes([0]) + struct.pack(">ff", 0.5, 2.0) + bytes([3]) + struct.pack(">H", 100) + bytes(200 * channels)
    write("resampler_fuzzer", f"c{channels}_s{stereo}", bytes([0, channels]) + struct.pack(">i", rate) + bytes([stereo]) + calls)
