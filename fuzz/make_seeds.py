"""Writes the fuzzers' seed corpora (kept in fuzz/corpus): small, valid inputs
of each kind. Sound files are written through libsndfile.

    python3 fuzz/make_seeds.py [DIRECTORY]
"""
import ctypes
import ctypes.util
import math
import os
import struct
import sys

out = sys.argv[1] if len(sys.argv) > 1 else os.path.join(os.path.dirname(__file__), "corpus")


def write(fuzzer, name, data):
    os.makedirs(os.path.join(out, fuzzer), exist_ok=True)
    with open(os.path.join(out, fuzzer, name), "wb") as f:
        f.write(data)


def pulse_samples(rate, seconds, period):
    values = []
    for i in range(int(rate * seconds)):
        since = math.fmod(i / rate, period)
        values.append(int(12000 * math.exp(-since * 30) * math.sin(2 * math.pi * 80 * since)))
    return values


def pulse(rate, seconds, channels, period):
    return b"".join(struct.pack("<h", v) * channels for v in pulse_samples(rate, seconds, period))


# Beat analysis: rate (int32), channels (int8), cancel byte, PCM.
for rate, channels, seconds in [(4000, 1, 2.5), (2000, 2, 3.0), (200, 1, 8.0), (44100, 1, 0.1)]:
    header = struct.pack("<iBB", rate, channels, 99)
    write("beat_analysis_fuzzer", f"pulse_{rate}_{channels}",
          header + pulse(rate, seconds, channels, 0.5))
write("beat_analysis_fuzzer", "silence", struct.pack("<iBB", 8000, 1, 99) + bytes(4000))
write("beat_analysis_fuzzer", "cancel_onsets", struct.pack("<iBB", 2000, 1, 33) + pulse(2000, 1.5, 1, 0.25))

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


# Resampler bridge: channels + 1, stereo flag, rate, misalignment, then
# calls: 0 rewrite a context byte, 1 restore it, 2 source rate, 3 gain,
# 4 a block (input bytes, offset, length, output bytes, frames to clear,
# accumulate) followed by its input.
def block(input_bytes, offset, length, output_bytes, frames, accumulate):
    return (bytes([4]) + struct.pack(">HiiHi", input_bytes, offset, length, output_bytes, frames)
            + bytes([accumulate]) + bytes(range(256)) * (input_bytes // 256) + bytes(input_bytes % 256))


for channels, stereo in [(1, 0), (2, 0), (1, 1)]:
    head = bytes([channels + 1, stereo]) + struct.pack(">i", 48000) + bytes([3])
    calls = bytes([2]) + struct.pack(">i", 44100) + block(882 * channels, 0, 441 * channels, 4000, 480, 0)
    calls += bytes([0, 0, 1]) + block(40, 0, 20, 40, 0, 1) + bytes([1]) + block(41, 1, 20, 400, 10, 0)
    write("resampler_bridge_fuzzer", f"c{channels}_s{stereo}", head + calls)


# Sound files: one short pulse train in each container the tool reads.
class SfInfo(ctypes.Structure):
    _fields_ = [("frames", ctypes.c_int64), ("samplerate", ctypes.c_int), ("channels", ctypes.c_int),
                ("format", ctypes.c_int), ("sections", ctypes.c_int), ("seekable", ctypes.c_int)]


sndfile = ctypes.CDLL(ctypes.util.find_library("sndfile"))
sndfile.sf_open.restype = ctypes.c_void_p
sndfile.sf_open.argtypes = [ctypes.c_char_p, ctypes.c_int, ctypes.POINTER(SfInfo)]
sndfile.sf_writef_short.argtypes = [ctypes.c_void_p, ctypes.c_void_p, ctypes.c_int64]
sndfile.sf_close.argtypes = [ctypes.c_void_p]
PCM_16 = 0x0002
for name, rate, channels, fmt in [
        ("pulse.wav", 4000, 1, 0x010000 | PCM_16), ("pulse.aiff", 4000, 2, 0x020000 | PCM_16),
        ("pulse.au", 2000, 1, 0x030000 | PCM_16), ("pulse.flac", 8000, 1, 0x170000 | PCM_16),
        ("pulse.ogg", 8000, 2, 0x200000 | 0x0060), ("pulse.mp3", 8000, 1, 0x230000 | 0x0082)]:
    samples = [v for v in pulse_samples(rate, 1.5, 0.5) for _ in range(channels)]
    path = os.path.join(out, "sound_file_fuzzer", name)
    os.makedirs(os.path.dirname(path), exist_ok=True)
    info = SfInfo(0, rate, channels, fmt, 0, 0)
    handle = sndfile.sf_open(path.encode(), 0x20, ctypes.byref(info))
    if not handle:
        sys.exit(f"libsndfile cannot write {name}")
    data = (ctypes.c_short * len(samples))(*samples)
    sndfile.sf_writef_short(handle, data, len(samples) // channels)
    sndfile.sf_close(handle)
