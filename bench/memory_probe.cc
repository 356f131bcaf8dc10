// Native memory of one beat analysis, the input streamed in blocks as the
// tool does, so no PCM is held:
//   memory_probe MINUTES [silence]
// prints "minutes input peak_mib kib_per_second beats", the peak being the
// process's resident high-water mark above its size before the analysis.
// Run once per length.
#include <sys/resource.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <algorithm>
#include <cstring>

#include "bench/pulse_track.h"
#include "jni/apm/audio_analyzer.h"

namespace {

double ResidentMib() {
  long pages = 0, resident = 0;
  FILE* statm = fopen("/proc/self/statm", "r");
  if (statm == nullptr || fscanf(statm, "%ld %ld", &pages, &resident) != 2) {
    abort();
  }
  fclose(statm);
  return resident * static_cast<double>(sysconf(_SC_PAGESIZE)) / (1 << 20);
}

double PeakMib() {
  rusage usage;
  getrusage(RUSAGE_SELF, &usage);
  return usage.ru_maxrss / 1024.0;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 2 || argc > 3 || (argc == 3 && strcmp(argv[2], "silence") != 0)) {
    fprintf(stderr, "usage: %s MINUTES [silence]\n", argv[0]);
    return 2;
  }
  const double minutes = atof(argv[1]);
  const bool silence = argc == 3;
  constexpr int kChannels = 2;
  constexpr size_t kBlock = 4096;
  PulseSource source(kChannels, !silence);
  std::vector<int16_t> block;
  source.Next(kBlock, &block);  // the block buffer counts as the caller's

  const double before = ResidentMib();
  const auto frames = static_cast<int64_t>(minutes * 60 * kPulseRate);
  apm::AudioAnalyzer analyzer(kPulseRate);
  analyzer.Begin(kChannels, frames, [](char) { return false; });
  for (int64_t done = 0; done < frames; done += kBlock) {
    const auto count = static_cast<int32_t>(
        std::min<int64_t>(kBlock, frames - done));
    source.Next(count, &block);
    analyzer.Feed(block.data(), count);
  }
  const int32_t beats = analyzer.Finish();
  const double peak = PeakMib() - before;
  printf("%g %s %.1f %.2f %d\n", minutes, silence ? "silence" : "pulse", peak,
         peak * 1024 / (minutes * 60), beats);
  return 0;
}
