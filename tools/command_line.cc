#include "tools/command_line.h"

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <map>
#include <set>

namespace cwtool {
namespace {

struct OptionSpec {
  const char* name;
  char short_name;  // 0: none
  bool takes_value;
};

const std::vector<OptionSpec> kBeatsOptions = {
    {"format", 0, true}, {"jobs", 'j', true},  {"quiet", 'q', false},
    {"verbose", 'v', false}, {"click", 0, true}, {"plot", 0, true},
    {"tempo", 0, true}, {"help", 'h', false}};
const std::vector<OptionSpec> kResampleOptions = {
    {"rate", 0, true}, {"gain", 0, true}, {"help", 'h', false}};
const std::vector<OptionSpec> kExampleOptions = {
    {"bpm", 0, true}, {"seconds", 0, true}, {"rate", 0, true},
    {"channels", 0, true}, {"help", 'h', false}};

struct Arguments {
  std::map<std::string, std::string> values;  // flags map to ""
  std::vector<std::string> positional;
  std::string error;
};

const OptionSpec* FindLong(const std::vector<OptionSpec>& specs,
                           const std::string& name) {
  for (const OptionSpec& spec : specs) {
    if (name == spec.name) return &spec;
  }
  return nullptr;
}

const OptionSpec* FindShort(const std::vector<OptionSpec>& specs, char name) {
  for (const OptionSpec& spec : specs) {
    if (spec.short_name != 0 && name == spec.short_name) return &spec;
  }
  return nullptr;
}

// Options may come before, between or after the positional arguments; "--"
// ends them.
Arguments Split(const std::vector<std::string>& args,
                const std::vector<OptionSpec>& specs) {
  Arguments out;
  bool options_done = false;
  for (size_t i = 0; i < args.size() && out.error.empty(); ++i) {
    const std::string& arg = args[i];
    if (options_done || arg.size() < 2 || arg[0] != '-') {
      out.positional.push_back(arg);
    } else if (arg == "--") {
      options_done = true;
    } else if (arg[1] == '-') {
      const size_t equals = arg.find('=');
      const std::string name = arg.substr(2, equals == std::string::npos ? std::string::npos : equals - 2);
      const OptionSpec* spec = FindLong(specs, name);
      if (spec == nullptr) {
        out.error = "unknown option '--" + name + "'";
      } else if (!spec->takes_value) {
        if (equals != std::string::npos) out.error = "--" + name + " takes no value";
        out.values[name] = "";
      } else if (equals != std::string::npos) {
        out.values[name] = arg.substr(equals + 1);
      } else if (i + 1 < args.size()) {
        out.values[name] = args[++i];
      } else {
        out.error = "--" + name + " needs a value";
      }
    } else {
      // Short flags may be grouped (-qv); a short option with a value takes
      // the rest of the word (-j4) or the next word (-j 4).
      for (size_t k = 1; k < arg.size(); ++k) {
        const OptionSpec* spec = FindShort(specs, arg[k]);
        if (spec == nullptr) {
          out.error = std::string("unknown option '-") + arg[k] + "'";
          break;
        }
        if (!spec->takes_value) {
          out.values[spec->name] = "";
          continue;
        }
        if (k + 1 < arg.size()) {
          out.values[spec->name] = arg.substr(k + 1);
        } else if (i + 1 < args.size()) {
          out.values[spec->name] = args[++i];
        } else {
          out.error = std::string("-") + arg[k] + " needs a value";
        }
        break;
      }
    }
  }
  return out;
}

bool ParseInt(const std::string& text, long low, long high, int* value) {
  if (text.empty()) return false;
  char* end = nullptr;
  errno = 0;
  const long v = std::strtol(text.c_str(), &end, 10);
  if (errno != 0 || *end != '\0' || v < low || v > high) return false;
  *value = static_cast<int>(v);
  return true;
}

bool ParseDouble(const std::string& text, double low, double high, double* value) {
  if (text.empty()) return false;
  char* end = nullptr;
  errno = 0;
  const double v = std::strtod(text.c_str(), &end);
  if (errno != 0 || *end != '\0' || !std::isfinite(v) || v < low || v > high) {
    return false;
  }
  *value = v;
  return true;
}

// Sample rates the library and libsndfile handle sensibly.
constexpr long kMinRate = 1000;
constexpr long kMaxRate = 768000;

std::string RateError(const std::string& text) {
  return "--rate '" + text + "' is not a sample rate in Hz (" +
         std::to_string(kMinRate) + " to " + std::to_string(kMaxRate) + ")";
}

std::string ParseBeats(const Arguments& a, BeatsOptions* out) {
  out->files = a.positional;
  if (out->files.empty()) return "beats needs at least one FILE";
  out->quiet = a.values.count("quiet") > 0;
  out->verbose = a.values.count("verbose") > 0;
  if (a.values.count("format")) {
    const std::string& f = a.values.at("format");
    if (f == "text") {
      out->format = ReportFormat::kText;
    } else if (f == "csv") {
      out->format = ReportFormat::kCsv;
    } else if (f == "json") {
      out->format = ReportFormat::kJson;
    } else {
      return "--format '" + f + "' is not one of text, csv, json";
    }
  }
  if (a.values.count("jobs") && !ParseInt(a.values.at("jobs"), 1, 1024, &out->jobs)) {
    return "--jobs '" + a.values.at("jobs") + "' is not a number from 1 to 1024";
  }
  if (a.values.count("tempo")) {
    const std::string error = ParseTempoRange(a.values.at("tempo"), &out->tempo);
    if (!error.empty()) return error;
  }
  for (const char* option : {"click", "plot"}) {
    if (!a.values.count(option)) continue;
    const std::string& pattern = a.values.at(option);
    std::string& target = std::string(option) == "click" ? out->click_pattern
                                                          : out->plot_pattern;
    target = pattern;
    if (pattern.empty()) return std::string("--") + option + " needs a file name";
    if (out->files.size() == 1) continue;
    if (pattern.find("{}") == std::string::npos) {
      return std::string("--") + option +
             " with several files needs '{}' in its name, e.g. '{}." +
             (std::string(option) == "click" ? "click.wav" : "svg") + "'";
    }
    std::set<std::string> names;
    for (const std::string& file : out->files) {
      if (!names.insert(OutputName(pattern, file)).second) {
        return std::string("--") + option + " '" + pattern +
               "' gives the same name '" + OutputName(pattern, file) +
               "' to two inputs";
      }
    }
  }
  return "";
}

std::string ParseResample(const Arguments& a, ResampleSettings* out) {
  if (a.positional.size() != 2) return "resample needs IN and OUT";
  out->input = a.positional[0];
  out->output = a.positional[1];
  if (!a.values.count("rate")) return "resample needs --rate HZ";
  if (!ParseInt(a.values.at("rate"), kMinRate, kMaxRate, &out->rate)) {
    return RateError(a.values.at("rate"));
  }
  if (a.values.count("gain")) {
    const std::string& gain = a.values.at("gain");
    const size_t comma = gain.find(',');
    double left = 0, right = 0;
    // Above 1 the mix could wrap around: the resampler does not clip.
    if (comma == std::string::npos ||
        !ParseDouble(gain.substr(0, comma), -1, 1, &left) ||
        !ParseDouble(gain.substr(comma + 1), -1, 1, &right)) {
      return "--gain '" + gain + "' is not L,R with both gains from -1 to 1";
    }
    out->left_gain = static_cast<float>(left);
    out->right_gain = static_cast<float>(right);
  }
  return "";
}

std::string ParseExample(const Arguments& a, GrooveSettings* out, std::string* path) {
  if (a.positional.size() != 1) return "example needs exactly one OUT file";
  *path = a.positional[0];
  if (a.values.count("bpm") && !ParseDouble(a.values.at("bpm"), 40, 300, &out->bpm)) {
    return "--bpm '" + a.values.at("bpm") + "' is not a tempo from 40 to 300";
  }
  if (a.values.count("seconds") &&
      (!ParseDouble(a.values.at("seconds"), 0, 3600, &out->seconds) || out->seconds <= 0)) {
    return "--seconds '" + a.values.at("seconds") + "' is not a duration from 0 to 3600";
  }
  if (a.values.count("rate") &&
      !ParseInt(a.values.at("rate"), kMinRate, kMaxRate, &out->sample_rate)) {
    return RateError(a.values.at("rate"));
  }
  if (a.values.count("channels") && !ParseInt(a.values.at("channels"), 1, 2, &out->channels)) {
    return "--channels '" + a.values.at("channels") + "' is not 1 or 2";
  }
  return "";
}

}  // namespace

CommandLine ParseCommandLine(int argc, const char* const* argv) {
  CommandLine line;
  const std::vector<std::string> args(argv + std::min(argc, 2), argv + argc);
  const std::string command = argc > 1 ? argv[1] : "";
  if (command == "--help" || command == "-h" || command == "help") {
    line.action = CommandLine::Action::kHelp;
    return line;
  }
  if (command == "--version") {
    line.action = CommandLine::Action::kVersion;
    return line;
  }
  const std::vector<OptionSpec>* specs =
      command == "beats"      ? &kBeatsOptions
      : command == "resample" ? &kResampleOptions
      : command == "example"  ? &kExampleOptions
                              : nullptr;
  if (specs == nullptr) {
    line.error = command.empty() ? "no command given"
                                 : "unknown command '" + command + "'";
    return line;
  }
  const Arguments parsed = Split(args, *specs);
  if (!parsed.error.empty()) {
    line.error = parsed.error;
    return line;
  }
  if (parsed.values.count("help")) {
    line.action = CommandLine::Action::kHelp;
    return line;
  }
  if (command == "beats") {
    line.error = ParseBeats(parsed, &line.beats);
    line.action = CommandLine::Action::kBeats;
  } else if (command == "resample") {
    line.error = ParseResample(parsed, &line.resample);
    line.action = CommandLine::Action::kResample;
  } else {
    line.error = ParseExample(parsed, &line.example, &line.example_path);
    line.action = CommandLine::Action::kExample;
  }
  if (!line.error.empty()) line.action = CommandLine::Action::kUsageError;
  return line;
}

std::string OutputName(const std::string& pattern, const std::string& input) {
  std::string stem = input.substr(input.find_last_of('/') + 1);
  const size_t dot = stem.find_last_of('.');
  if (dot != std::string::npos && dot > 0) stem.erase(dot);
  std::string out = pattern;
  for (size_t at = out.find("{}"); at != std::string::npos;
       at = out.find("{}", at + stem.size())) {
    out.replace(at, 2, stem);
  }
  return out;
}

const char* HelpText() {
  return R"(Usage:
  clipweaver beats [options] FILE...
  clipweaver resample IN OUT --rate HZ [--gain L,R]
  clipweaver example OUT [--bpm BPM] [--seconds S] [--rate HZ] [--channels N]
  clipweaver --help | --version

beats: prints the tempo and the beat times (in seconds) of each FILE. Any
format libsndfile reads will do: WAV, FLAC, Ogg Vorbis, AIFF, ...
  --format F      text (default), csv (file,tempo_bpm,beat,time_s) or json
                  (one object per file and line)
  -j, --jobs N    analyse N files at a time (default: one per core); the
                  results still come in the order of the arguments
  --click OUT     also write the input mixed with a click on every beat
  --plot OUT.svg  also draw the waveform, the onset strength and the beats
                  With several files OUT must hold '{}', which stands for
                  each input's name without directory and extension.
  --tempo MIN-MAX only look for tempi from MIN to MAX BPM (within 30-1200),
                  e.g. 150-210 where the default finds half or 2/3 time
  -q, --quiet     no progress bar (it is only drawn when stderr is a terminal)
  -v, --verbose   let the analysis log through to stderr (no progress bar)
  Files shorter than 1 second are refused. Ctrl-C stops the analysis,
  prints what has finished and exits with status 130.

resample: converts IN to another sample rate with the linear resampler,
block by block; mono stays mono and stereo stays stereo.
  --rate HZ       output sample rate (required); at most a 3:1 reduction
  --gain L,R      gains of the left and right channel from -1 to 1
                  (default 1,1; a mono file takes L)

example: writes the example groove: a kick on every beat, a snare on beats
2 and 4 and a hi-hat on every off-beat, the same on every machine.
  --bpm BPM       tempo from 40 to 300 (default 120)
  --seconds S     length (default 20)
  --rate HZ       sample rate (default 44100)
  --channels N    1 or 2 (default 2)

Written files take their format from the extension: .wav, .flac, .ogg,
.aiff or .au (16-bit where the format has a bit depth).

Exit status: 0 success, 1 some file failed, 2 bad command line,
130 interrupted.

Examples:
  clipweaver example groove.wav --bpm 100
  clipweaver beats groove.wav
  clipweaver beats --format json -j 4 music/*.flac > beats.jsonl
  clipweaver beats song.ogg --click song-clicks.wav --plot song.svg
  clipweaver beats ballad.flac --tempo 50-80
  clipweaver beats *.wav --plot 'plots/{}.svg' --quiet
  clipweaver resample song.wav song-48k.flac --rate 48000 --gain 0.8,0.8
)";
}

}  // namespace cwtool
