// Native memory of one beat analysis beyond the caller's PCM buffer:
//   memory_probe MINUTES
// prints "minutes pcm_mib native_peak_mib". Run once per length: the peak
// is the process's.
#include <sys/resource.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>

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
  if (argc != 2) {
    fprintf(stderr, "usage: %s MINUTES\n", argv[0]);
    return 2;
  }
  const double minutes = atof(argv[1]);
  const std::vector<int16_t> pcm = PulseTrack(minutes * 60, 2);
  const double before = ResidentMib();
  if (PeakMib() > before + 1) {
    fprintf(stderr, "warning: peak before the analysis above resident size\n");
  }
  apm::AudioAnalyzer analyzer(kPulseRate);
  const int32_t beats = analyzer.CalculateBeats(
      reinterpret_cast<const uint8_t*>(pcm.data()),
      static_cast<int32_t>(pcm.size() * 2), 2, [](char) { return false; });
  printf("%g %.1f %.1f %d\n", minutes, pcm.size() * 2.0 / (1 << 20),
         PeakMib() - before, beats);
  return 0;
}
