#include "tools/beats_command.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <thread>
#include <vector>

#include "base/platform_log.h"
#include "jni/apm/tempo_range.h"
#include "tools/beat_analysis.h"
#include "tools/console.h"
#include "tools/interrupt.h"
#include "tools/ordered_batch.h"
#include "tools/output_collisions.h"
#include "tools/report.h"
#include "tools/text_escape.h"

namespace cwtool {
namespace {

std::string BaseName(const std::string& path) {
  return path.substr(path.find_last_of('/') + 1);
}

ExtraOutputs ExtrasFor(const BeatsOptions& options, const std::string& file) {
  ExtraOutputs extras;
  if (!options.click_pattern.empty()) {
    extras.click_path = OutputName(options.click_pattern, file);
  }
  if (!options.plot_pattern.empty()) {
    extras.plot_path = OutputName(options.plot_pattern, file);
  }
  if (!options.html_pattern.empty()) {
    extras.html_path = OutputName(options.html_pattern, file);
  }
  return extras;
}

std::string CheckOutputs(const BeatsOptions& options) {
  std::vector<PlannedOutput> outputs;
  for (const std::string& file : options.files) {
    const ExtraOutputs extras = ExtrasFor(options, file);
    if (!extras.click_path.empty()) outputs.push_back({extras.click_path, "--click output"});
    if (!extras.plot_path.empty()) outputs.push_back({extras.plot_path, "--plot output"});
    if (!extras.html_path.empty()) outputs.push_back({extras.html_path, "--html output"});
  }
  return FindCollision(options.files, outputs);
}

}  // namespace

int RunBeats(const BeatsOptions& options) {
  // A range too narrow for some input is a usage error: refused before any
  // file is analysed.
  const std::string range_error =
      CheckTempoRangeForFiles(options.tempo, options.files);
  if (!range_error.empty()) {
    fprintf(stderr, "clipweaver: %s\n", range_error.c_str());
    return 2;
  }
  const std::string collision = CheckOutputs(options);
  if (!collision.empty()) {
    fprintf(stderr, "clipweaver: %s\n", collision.c_str());
    return 2;
  }
  const apm::ApmConfig config =
      options.tempo.given
          ? apm::ConfigForTempoRange(options.tempo.min_bpm, options.tempo.max_bpm)
          : apm::ApmConfig();
  const size_t count = options.files.size();
  const int cores = static_cast<int>(std::max(1u, std::thread::hardware_concurrency()));
  const int workers = static_cast<int>(
      std::min<size_t>(count, static_cast<size_t>(options.jobs > 0 ? options.jobs : cores)));

  const int err_fd = fcntl(STDERR_FILENO, F_DUPFD_CLOEXEC, 0);
  const bool bars = !options.quiet && !options.verbose && isatty(err_fd);
  // The library's lines are for those who ask for them.
  if (!options.verbose) platform_log::SetStderrSink([](int, const char*) {});
  const std::atomic<bool>& interrupted = InterruptFlag();

  int failures = 0;
  {
    Console console(err_fd, bars ? workers : 0);
    const Report report(options.format);
    std::vector<BeatResult> results(count);
    OrderedBatch batch(count, workers, [&](size_t index, int worker) {
      const std::string& file = options.files[index];
      const std::string label = TerminalText(BaseName(file));
      console.Progress(worker, label, 0);
      results[index] = AnalyseFile(
          file, config, ExtrasFor(options, file),
          [&](int percent) { console.Progress(worker, label, percent); });
      console.ProgressIdle(worker);
    });

    console.Result(report.Header());
    size_t finished = 0;
    std::string stopped;  // the first file Ctrl-C cut short
    for (size_t i = 0; i < count; ++i) {
      batch.WaitFor(i);
      BeatResult& r = results[i];
      if (r.interrupted) {
        if (stopped.empty()) stopped = options.files[i];
        continue;
      }
      ++finished;
      if (!r.warning.empty()) {
        console.Message("clipweaver: " + r.path + ": warning: " + r.warning +
                        "; analysed what is there");
      }
      if (!r.error.empty()) {
        ++failures;
        console.Message("clipweaver: " + r.path + ": " + r.error);
        console.Result(report.Failure(r.path, r.error));
      } else {
        console.Result(report.Result(r));
        if (!r.output_error.empty()) {
          ++failures;
          console.Message("clipweaver: " + r.path + ": " + r.output_error);
        }
      }
      r = BeatResult{};  // printed: its memory can go
    }
    if (interrupted.load()) {
      console.Message("clipweaver: interrupted: " +
                      (stopped.empty() ? "" : "analysis of " + stopped + " stopped; ") +
                      std::to_string(finished) + " of " + std::to_string(count) +
                      " files done, no output left from the others");
    }
    // Leaving the scope joins the workers before the console goes.
  }
  close(err_fd);
  if (interrupted.load()) return 130;
  return failures > 0 ? 1 : 0;
}

}  // namespace cwtool
