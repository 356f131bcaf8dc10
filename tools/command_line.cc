#include "tools/command_line.h"

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <getopt.h>
#include <map>
#include <set>

#include "tools/audio_file.h"

namespace cwtool {
namespace {

enum Command { kBeatsCommand, kResampleCommand, kExampleCommand };

// Every option of every command, with its help; the parser and the help
// text are made from this table alone.
struct OptionSpec {
  Command command;
  const char* name;
  char short_name;    // 0: none
  const char* value;  // what the option takes, as the help names it; null: a flag
  const char* help;   // lines after the first are indented under it
};

constexpr OptionSpec kOptions[] = {
    {kBeatsCommand, "format", 0, "F",
     "text (default), csv (file,tempo_bpm,beat,time_s) or json\n"
     "(one object per file and line)"},
    {kBeatsCommand, "jobs", 'j', "N",
     "analyse N files at a time (default: one per core); the\n"
     "results still come in the order of the arguments"},
    {kBeatsCommand, "tempo", 0, "MIN-MAX",
     "only look for tempi from MIN to MAX BPM (within 30-1200),\n"
     "e.g. 150-210 where the default finds half or 2/3 time"},
    {kBeatsCommand, "click", 0, "OUT",
     "also write the input mixed with a click on every beat"},
    {kBeatsCommand, "plot", 0, "OUT.svg",
     "also draw the waveform, the onset strength and the beats,\n"
     "the whole track on top, then in rows of 10 seconds"},
    {kBeatsCommand, "html", 0, "OUT.html",
     "also write a page that shows and plays the track with its\n"
     "beats (zoom, seek, a click on every beat), usable offline\n"
     "With several files OUT must hold '{}', which stands for\n"
     "each input's name without directory and extension."},
    {kBeatsCommand, "quiet", 'q', nullptr,
     "no progress bar (it is only drawn when stderr is a terminal)"},
    {kBeatsCommand, "verbose", 'v', nullptr,
     "let the analysis log through to stderr (no progress bar)"},
    {kResampleCommand, "rate", 0, "HZ",
     "output sample rate (required); at most a 3:1 reduction"},
    {kResampleCommand, "gain", 0, "L,R",
     "gains of the left and right channel from -1 to 1\n"
     "(default 1,1; a mono file takes L)"},
    {kExampleCommand, "bpm", 0, "BPM", "tempo from 40 to 300 (default 120)"},
    {kExampleCommand, "seconds", 0, "S", "length (default 20)"},
    {kExampleCommand, "rate", 0, "HZ", "sample rate (default 44100)"},
    {kExampleCommand, "channels", 0, "N", "1 or 2 (default 2)"},
};

struct CommandSpec {
  Command command;
  const char* name;
  const char* usage;  // after the command's name
  const char* about;  // before the options
  const char* notes;  // after them; may be empty
};

constexpr CommandSpec kCommands[] = {
    {kBeatsCommand, "beats", "[options] FILE...",
     "prints the tempo and the beat times (in seconds) of each FILE. Any\n"
     "format libsndfile reads will do: WAV, FLAC, Ogg Vorbis, AIFF, ...",
     "Files shorter than 1 second are refused, and so are pipes and devices\n"
     "(sound files are read with seeks). A file shorter than its header\n"
     "announces is analysed with a warning."},
    {kResampleCommand, "resample", "IN OUT --rate HZ [--gain L,R]",
     "converts IN to another sample rate with the linear resampler,\n"
     "block by block; mono stays mono and stereo stays stereo.",
     ""},
    {kExampleCommand, "example", "OUT [--bpm BPM] [--seconds S] [--rate HZ] [--channels N]",
     "writes the example groove: a kick on every beat, a snare on beats\n"
     "2 and 4 and a hi-hat on every off-beat, the same on every machine.",
     ""},
};

constexpr const char* kHelpOption = "help";

struct Arguments {
  std::map<std::string, std::string> values;  // flags map to ""
  std::vector<std::string> positional;
  std::string error;
};

// Options may come before, between or after the positional arguments; "--"
// ends them. Short flags group (-qv); a short value may be attached (-j4).
Arguments Split(Command command, int argc, const char* const* argv) {
  std::vector<const OptionSpec*> specs;
  std::vector<option> longs;
  std::string shorts = ":h";  // ':' first: a missing value is told apart
  for (const OptionSpec& spec : kOptions) {
    if (spec.command != command) continue;
    const int id = static_cast<int>(specs.size()) + 256;
    longs.push_back({spec.name, spec.value ? required_argument : no_argument, nullptr, id});
    if (spec.short_name != 0) {
      shorts += spec.short_name;
      if (spec.value) shorts += ':';
    }
    specs.push_back(&spec);
  }
  longs.push_back({kHelpOption, no_argument, nullptr, 'h'});
  longs.push_back({nullptr, 0, nullptr, 0});

  // getopt_long reorders its argument vector: it gets a copy.
  std::vector<std::string> words(argv, argv + argc);
  std::vector<char*> pointers;
  for (std::string& word : words) pointers.push_back(&word[0]);
  pointers.push_back(nullptr);

  Arguments out;
  const auto find = [&](int id) -> const OptionSpec* {
    for (const OptionSpec* spec : specs) {
      if (id == spec->short_name ||
          (id >= 256 && spec == specs[static_cast<size_t>(id - 256)])) {
        return spec;
      }
    }
    return nullptr;
  };
  opterr = 0;
  optind = 0;  // a full reset, as a first call
  for (int id; (id = getopt_long(argc, pointers.data(), shorts.c_str(), longs.data(),
                                 nullptr)) != -1;) {
    const std::string word = pointers[static_cast<size_t>(optind - 1)];
    if (id == 'h') {
      out.values[kHelpOption] = "";
    } else if (id == ':') {
      const OptionSpec* spec = find(optopt);
      out.error = (spec && optopt < 256 ? std::string("-") + spec->short_name
                                        : word) + " needs a value";
      return out;
    } else if (id == '?') {
      const std::string name = word.substr(0, word.find('='));
      if (optopt != 0 && optopt < 256) {
        out.error = std::string("unknown option '-") + static_cast<char>(optopt) + "'";
      } else if (word.find('=') != std::string::npos && find(optopt)) {
        out.error = name + " takes no value";
      } else {
        out.error = "unknown option '" + name + "'";
      }
      return out;
    } else {
      out.values[find(id)->name] = optarg ? optarg : "";
    }
  }
  out.positional.assign(pointers.begin() + optind, pointers.end() - 1);
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
  // Each output option: its pattern, the ending it needs (empty: an audio
  // format's) and the example its help gives for several files.
  struct OutputOption {
    const char* name;
    std::string* pattern;
    const char* ending;
    const char* example;
  };
  const OutputOption outputs[] = {{"click", &out->click_pattern, "", "click.wav"},
                                  {"plot", &out->plot_pattern, ".svg", "svg"},
                                  {"html", &out->html_pattern, ".html", "html"}};
  for (const OutputOption& output : outputs) {
    const std::string option = output.name;
    if (!a.values.count(option)) continue;
    const std::string& pattern = a.values.at(option);
    *output.pattern = pattern;
    if (pattern.empty()) return "--" + option + " needs a file name";
    const std::string ending = output.ending;
    if (ending.empty() && OutputFormatFor(pattern) == 0) {
      return "--" + option + " '" + pattern + "': " + kUnknownOutputFormat;
    }
    if (!ending.empty() && (pattern.size() < ending.size() ||
                            pattern.compare(pattern.size() - ending.size(),
                                            ending.size(), ending) != 0)) {
      return "--" + option + " '" + pattern + "' does not end in " + ending;
    }
    if (out->files.size() == 1) continue;
    if (pattern.find("{}") == std::string::npos) {
      return "--" + option + " with several files needs '{}' in its name, e.g. '{}." +
             output.example + "'";
    }
    std::set<std::string> names;
    for (const std::string& file : out->files) {
      if (!names.insert(OutputName(pattern, file)).second) {
        return "--" + option + " '" + pattern +
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
  if (OutputFormatFor(out->output) == 0) return out->output + ": " + kUnknownOutputFormat;
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
  if (OutputFormatFor(*path) == 0) return *path + ": " + kUnknownOutputFormat;
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
  const std::string name = argc > 1 ? argv[1] : "";
  if (name == "--help" || name == "-h" || name == "help") {
    line.action = CommandLine::Action::kHelp;
    return line;
  }
  if (name == "--version") {
    line.action = CommandLine::Action::kVersion;
    return line;
  }
  const CommandSpec* command = nullptr;
  for (const CommandSpec& spec : kCommands) {
    if (name == spec.name) command = &spec;
  }
  if (command == nullptr) {
    line.error = name.empty() ? "no command given" : "unknown command '" + name + "'";
    return line;
  }
  // The command's name stands where getopt expects the program's.
  const Arguments parsed = Split(command->command, argc - 1, argv + 1);
  if (!parsed.error.empty()) {
    line.error = parsed.error;
    return line;
  }
  if (parsed.values.count(kHelpOption)) {
    line.action = CommandLine::Action::kHelp;
    return line;
  }
  switch (command->command) {
    case kBeatsCommand:
      line.error = ParseBeats(parsed, &line.beats);
      line.action = CommandLine::Action::kBeats;
      break;
    case kResampleCommand:
      line.error = ParseResample(parsed, &line.resample);
      line.action = CommandLine::Action::kResample;
      break;
    case kExampleCommand:
      line.error = ParseExample(parsed, &line.example, &line.example_path);
      line.action = CommandLine::Action::kExample;
      break;
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

std::string HelpText() {
  constexpr size_t kHelpColumn = 18;
  std::string text = "Usage:\n";
  for (const CommandSpec& command : kCommands) {
    text += std::string("  clipweaver ") + command.name + " " + command.usage + "\n";
  }
  text += "  clipweaver --help | --version\n";
  const auto indented = [](std::string lines, size_t by) {
    for (size_t at = lines.find('\n'); at != std::string::npos; at = lines.find('\n', at + by + 1)) {
      lines.insert(at + 1, by, ' ');
    }
    return lines + "\n";
  };
  for (const CommandSpec& command : kCommands) {
    text += std::string("\n") + command.name + ": " + command.about + "\n";
    for (const OptionSpec& option : kOptions) {
      if (option.command != command.command) continue;
      std::string head = "  ";
      head += option.short_name ? std::string("-") + option.short_name + ", " : "";
      head += std::string("--") + option.name + (option.value ? std::string(" ") + option.value : "");
      head.resize(std::max(head.size() + 1, kHelpColumn), ' ');
      text += head + indented(option.help, kHelpColumn);
    }
    if (*command.notes) text += indented(std::string("  ") + command.notes, 2);
  }
  return text + R"(
Written files take their format from the extension: .wav, .flac, .ogg,
.aiff or .au (16-bit where the format has a bit depth; a WAV past 4 GiB
becomes RF64, and a length the format cannot hold is refused). Nothing
appears under an output's name before it is complete: an error or Ctrl-C
leaves no partial file and existing files untouched. An output that is the
same file as an input or as another output is refused before any work.

Ctrl-C stops any command at once; beats prints what has finished first.

Exit status: 0 success, 1 some file failed, 2 bad command line or
colliding outputs, 130 interrupted.

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
