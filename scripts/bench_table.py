"""Prints the benchmark figures of scripts/bench as a Markdown table."""
import json
import os
import platform
import statistics
import sys

out = sys.argv[1]


def medians(name):
    path = os.path.join(out, name + ".json")
    if not os.path.exists(path):
        return {}
    with open(path) as f:
        data = json.load(f)
    result = {}
    for b in data["benchmarks"]:
        if b.get("aggregate_name") == "median":
            result[b["run_name"]] = b
    return result


def cpu_model():
    try:
        with open("/proc/cpuinfo") as f:
            for line in f:
                if line.startswith("model name"):
                    return line.split(":", 1)[1].strip()
    except OSError:
        pass
    return platform.processor()


rows = []
fft = medians("real_fft_bench")
# The lengths the analysis takes for its 40 ms window, by input rate.
for n, rates in ((512, "8-12 kHz"), (1024, "16-24 kHz"), (2048, "32-48 kHz"),
                 (4096, "64-96 kHz")):
    ours, both = fft.get(f"BM_RealFftForward/{n}"), fft.get(f"BM_RealFftOverFftw/{n}")
    if ours:
        rows.append((f"real FFT, {n} points (double; {rates} input)",
                     f"{ours['real_time']:.0f} ns",
                     f"{both['ratio']:.2f}x FFTW r2c (alternating batches)" if both else ""))

analysis = medians("analysis_bench")
whole = analysis.get("BM_WholeAnalysis180sStereo/iterations:3")
front = analysis.get("BM_SpectrogramAndOnsets60s")
onset = analysis.get("BM_OnsetFrame")
if onset:
    rows.append(("onset detection, one 1025-bin frame", f"{onset['real_time']:.0f} ns", ""))
if front:
    rows.append(("spectrogram + onsets, 60 s mono", f"{front['real_time']:.1f} ms", ""))
if whole:
    rows.append(("whole analysis, 180 s stereo", f"{whole['real_time']:.0f} ms",
                 f"{whole['realtime_x']:.0f}x real time; tracker {100 * whole['tracker_share']:.0f}%"))

apm = medians("apm_bench")
for name, b in apm.items():
    rows.append((f"tracker ({name})", f"{b['real_time'] / 1000:.1f} us" if b["time_unit"] == "ns" else f"{b['real_time']:.1f} {b['time_unit']}", ""))

resampler = medians("resampler_bench")


def frames_per_second(name):
    b = resampler.get(name)
    return b.get("frames/s") if b else None


for channels, stereo_out, label in [(1, 0, "mono"), (1, 1, "mono to stereo"), (2, 0, "stereo")]:
    ours = frames_per_second(f"BM_LinearResampler/channels:{channels}/stereo_out:{stereo_out}")
    if not ours:
        continue
    ratios = []
    for ref, ref_label in [("BM_SpeedupOverSamplerate", "libsamplerate linear"),
                           ("BM_SpeedupOverSpeex", "speexdsp q0")]:
        both = resampler.get(f"{ref}/channels:{channels}")
        if both and not stereo_out:
            ratios.append(f"{both['speedup']:.1f}x {ref_label}")
    rows.append((f"resampler 44.1 to 48 kHz, {label}", f"{ours / 1e6:.0f} M frames/s", ", ".join(ratios)))

programs = {}
path = os.path.join(out, "programs.txt")
if os.path.exists(path):
    with open(path) as f:
        for line in f:
            parts = line.split()
            if len(parts) == 4 and parts[0] in ("aubiotrack", "clipweaver"):
                programs.setdefault(parts[0], []).append((float(parts[1]) + float(parts[2]), int(parts[3])))
if "clipweaver" in programs:
    cpu = statistics.median(c for c, _ in programs["clipweaver"])
    rss = statistics.median(m for _, m in programs["clipweaver"]) / 1024
    ratio = ""
    if "aubiotrack" in programs:
        ref = statistics.median(c for c, _ in programs["aubiotrack"])
        ratio = f"{cpu / ref:.2f}x aubiotrack's {ref:.3f} s"
    rows.append(("`clipweaver beats`, 180 s stereo WAV, CPU", f"{cpu:.3f} s (peak {rss:.0f} MiB)", ratio))

path = os.path.join(out, "instructions.txt")
if os.path.exists(path):
    with open(path) as f:
        counts = dict(line.split() for line in f if len(line.split()) == 2)
    for name, label in [("clipweaver", "AVX kernels"), ("clipweaver-no-avx", "baseline kernels")]:
        if name in counts:
            ratio = ""
            if "aubiotrack" in counts:
                ratio = f"{int(counts[name]) / int(counts['aubiotrack']):.2f}x aubiotrack's {int(counts['aubiotrack']) / 1e9:.2f} G"
            rows.append((f"`clipweaver beats`, 180 s stereo WAV, instructions ({label})",
                         f"{int(counts[name]) / 1e9:.2f} G", ratio))

path = os.path.join(out, "memory.txt")
if os.path.exists(path):
    with open(path) as f:
        for line in f:
            minutes, kind, native, per_second, _ = line.split()
            rows.append((f"native memory, {minutes} min stereo {kind}, streamed", f"{native} MiB",
                         f"{per_second} KiB per second of audio"))

print(f"Measured on {cpu_model()}, {os.cpu_count()} cores; medians of 5 runs (11 for whole"
      " programs).\n")
print("| measure | value | comparison |")
print("|---|---|---|")
for row in rows:
    print("| " + " | ".join(row) + " |")
