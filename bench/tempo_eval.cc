// Beat tracking against known beats: synthesised music in several meters,
// tempi from 60 to 190 BPM, swing, syncopation, a tempo change, quiet and
// dense passages and noise, analysed with the tracker's defaults and with
// a range of the true tempo /1.3 .. x1.3 under each prior.
//   tempo_eval [--tracks]
// prints the summary table (and with --tracks one line per track and set-up).
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "jni/apm/analysis_frame_rate.h"
#include "jni/apm/audio_analyzer.h"
#include "jni/apm/tempo_estimate.h"
#include "jni/apm/tempo_range.h"

namespace {

constexpr int kRate = 44100;
constexpr double kSeconds = 30.0;
// Annotations and detections in the first seconds are not scored: every
// tracker needs a few beats to lock on.
constexpr double kSkipSeconds = 5.0;
constexpr double kHitWindow = 0.07;
constexpr double kContinuityTolerance = 0.175;

struct Piece {
  const char* name;
  double bpm;
  double second_bpm;    // after the middle; 0: constant tempo
  int beats_per_bar;
  int subdivision;      // hi-hats per beat: 2 or 3 (compound meter)
  double swing;         // delay of the off-beat hats, in beats
  bool syncopated;      // kicks moved onto off-beats
  bool dense;           // sixteenths and random percussion
  bool quiet_middle;    // a passage at -24 dB
  double noise;         // white noise level against the drums
  bool pads;            // chords on every bar
};

const Piece kPieces[] = {
    {"ballad-60-4/4", 60, 0, 4, 2, 0, false, false, false, 0.01, true},
    {"slow-66-6/8", 66, 0, 2, 3, 0, false, false, false, 0.01, true},
    {"soul-72-swing", 72, 0, 4, 2, 0.17, false, false, true, 0.01, true},
    {"hiphop-88-swing", 88, 0, 4, 2, 0.12, true, false, false, 0.02, false},
    {"waltz-92-3/4", 92, 0, 3, 2, 0, false, false, false, 0.01, true},
    {"pop-100-4/4", 100, 0, 4, 2, 0, false, false, false, 0.01, true},
    {"rock-112-noise", 112, 0, 4, 2, 0, false, false, false, 0.2, false},
    {"pop-117.6-4/4", 117.6, 0, 4, 2, 0, false, false, true, 0.01, true},
    {"funk-122-sync", 122, 0, 4, 2, 0, true, true, false, 0.02, false},
    {"house-126-dense", 126, 0, 4, 2, 0, false, true, false, 0.02, true},
    {"latin-132-5/4", 132, 0, 5, 2, 0, true, false, false, 0.02, true},
    {"shuffle-138-12/8", 138, 0, 4, 3, 0, false, false, false, 0.02, false},
    {"techno-145-noise", 145, 0, 4, 2, 0, false, true, false, 0.15, false},
    {"trance-150-7/8", 150, 0, 7, 2, 0, false, false, true, 0.01, true},
    {"dnb-174-sync", 174, 0, 4, 2, 0, true, true, false, 0.02, false},
    {"punk-182-4/4", 182, 0, 4, 2, 0, false, false, false, 0.05, false},
    {"speed-190-dense", 190, 0, 4, 2, 0, false, true, false, 0.03, false},
    {"change-96-to-104", 96, 104, 4, 2, 0, false, false, false, 0.01, true},
    {"change-80-to-70", 80, 70, 4, 2, 0.1, false, false, false, 0.01, true},
    {"change-140-to-160", 140, 160, 4, 2, 0, true, false, false, 0.02, false},
};

struct Track {
  std::vector<int16_t> pcm;
  std::vector<double> beats;
};

std::vector<double> BeatTimes(const Piece& p) {
  std::vector<double> beats;
  const double start = 0.25;
  double t = start;
  while (t < kSeconds - 0.1) {
    beats.push_back(t);
    const bool second_half = p.second_bpm > 0 && t >= kSeconds / 2;
    t += 60.0 / (second_half ? p.second_bpm : p.bpm);
  }
  return beats;
}

void AddKick(double at, double gain, std::vector<double>* out) {
  const int64_t first = std::llround(at * kRate);
  for (int64_t i = 0; i < kRate / 3 && first + i < static_cast<int64_t>(out->size()); ++i) {
    const double tau = static_cast<double>(i) / kRate;
    const double phase = 45 * tau + 110 * 0.025 * (1 - std::exp(-tau / 0.025));
    (*out)[first + i] += gain * std::exp(-tau / 0.1) * std::sin(2 * M_PI * phase);
  }
}

void AddNoiseHit(double at, double gain, double decay, bool bright,
                 std::mt19937* random, std::vector<double>* out) {
  std::uniform_real_distribution<double> noise(-1, 1);
  const int64_t first = std::llround(at * kRate);
  double last = 0;
  for (int64_t i = 0; i < 5 * decay * kRate && first + i < static_cast<int64_t>(out->size());
       ++i) {
    const double tau = static_cast<double>(i) / kRate;
    const double n = noise(*random);
    (*out)[first + i] += gain * std::exp(-tau / decay) * (bright ? n - last : n);
    last = n;
  }
}

// A soft-attack triad lasting a bar: onsets without a sharp edge.
void AddChord(double at, double length, int root, std::vector<double>* out) {
  const int64_t first = std::llround(at * kRate);
  const double freqs[] = {220.0 * std::pow(2, root / 12.0),
                          220.0 * std::pow(2, (root + 4) / 12.0),
                          220.0 * std::pow(2, (root + 7) / 12.0)};
  for (int64_t i = 0; i < length * kRate && first + i < static_cast<int64_t>(out->size());
       ++i) {
    const double tau = static_cast<double>(i) / kRate;
    const double envelope = std::min(1.0, tau / 0.08) * std::exp(-tau / 1.5);
    double v = 0;
    for (const double f : freqs) v += std::sin(2 * M_PI * f * tau);
    (*out)[first + i] += 0.06 * envelope * v;
  }
}

Track Synthesise(const Piece& p, unsigned seed) {
  std::mt19937 random(seed);
  std::uniform_real_distribution<double> unit(0, 1);
  Track track;
  track.beats = BeatTimes(p);
  std::vector<double> mix(static_cast<size_t>(kSeconds * kRate), 0.0);
  const std::vector<double>& b = track.beats;
  const int roots[] = {0, 5, 7, 3, 8, 10};
  for (size_t i = 0; i < b.size(); ++i) {
    const double period = i + 1 < b.size() ? b[i + 1] - b[i] : b[i] - b[i - 1];
    const int in_bar = static_cast<int>(i % p.beats_per_bar);
    const double level = p.quiet_middle && b[i] > 12 && b[i] < 18 ? 0.06 : 1.0;
    const bool downbeat = in_bar == 0;
    // Syncopated grooves leave some beats without a kick and put one on
    // the off-beat before them.
    const bool skip_kick = p.syncopated && (in_bar == 1 || in_bar == 3);
    if (!skip_kick && (downbeat || in_bar % 2 == 0 || p.beats_per_bar == 2)) {
      AddKick(b[i], 0.8 * level, &mix);
    }
    if (p.syncopated && in_bar == 1) AddKick(b[i] + period / 2, 0.6 * level, &mix);
    if (in_bar % 2 == 1 && !(p.beats_per_bar % 2 == 1 && in_bar + 1 == p.beats_per_bar)) {
      AddNoiseHit(b[i], 0.35 * level, 0.05, false, &random, &mix);
    }
    for (int s = 0; s < p.subdivision; ++s) {
      double at = b[i] + period * s / p.subdivision;
      if (s == 1 && p.subdivision == 2) at += p.swing * period;
      AddNoiseHit(at, (s == 0 ? 0.12 : 0.08) * level, 0.012, true, &random, &mix);
    }
    if (p.dense) {
      for (int s = 1; s < 4; s += 2) {
        AddNoiseHit(b[i] + period * s / 4, 0.05 * level, 0.008, true, &random, &mix);
      }
      if (unit(random) < 0.4) {
        AddNoiseHit(b[i] + period * (0.25 + 0.5 * std::floor(unit(random) * 2)),
                    0.15 * level, 0.03, false, &random, &mix);
      }
    }
    if (p.pads && downbeat) {
      AddChord(b[i], period * p.beats_per_bar, roots[(i / p.beats_per_bar) % 6], &mix);
    }
  }
  std::normal_distribution<double> hiss(0, p.noise);
  track.pcm.resize(mix.size());
  for (size_t i = 0; i < mix.size(); ++i) {
    const double v = 0.5 * (mix[i] + hiss(random)) * 32767.0;
    track.pcm[i] = static_cast<int16_t>(std::lround(std::clamp(v, -32768.0, 32767.0)));
  }
  return track;
}

std::vector<double> Scored(const std::vector<double>& beats) {
  std::vector<double> out;
  for (const double t : beats) {
    if (t >= kSkipSeconds) out.push_back(t);
  }
  return out;
}

double FMeasure(const std::vector<double>& reference, const std::vector<double>& detected) {
  const std::vector<double> ref = Scored(reference), det = Scored(detected);
  if (ref.empty() || det.empty()) return 0;
  std::vector<bool> used(det.size(), false);
  int hits = 0;
  for (const double r : ref) {
    for (size_t j = 0; j < det.size(); ++j) {
      if (!used[j] && std::fabs(det[j] - r) <= kHitWindow) {
        used[j] = true;
        ++hits;
        break;
      }
    }
  }
  const double precision = static_cast<double>(hits) / det.size();
  const double recall = static_cast<double>(hits) / ref.size();
  return hits == 0 ? 0 : 2 * precision * recall / (precision + recall);
}

// Fraction of reference beats met by a detection within 17.5 % of the
// beat period whose interval to the previous detection also matches.
double Continuity(const std::vector<double>& reference, const std::vector<double>& detected) {
  int correct = 0, counted = 0;
  for (size_t i = 1; i < reference.size(); ++i) {
    if (reference[i] < kSkipSeconds) continue;
    ++counted;
    const double period = reference[i] - reference[i - 1];
    const double tolerance = kContinuityTolerance * period;
    const auto near = std::lower_bound(detected.begin(), detected.end(), reference[i] - tolerance);
    if (near == detected.end() || *near > reference[i] + tolerance || near == detected.begin()) {
      continue;
    }
    const double interval = *near - *(near - 1);
    if (std::fabs(interval - period) <= tolerance) ++correct;
  }
  return counted == 0 ? 0 : static_cast<double>(correct) / counted;
}

// Continuity at the annotated level, double, either half or the off-beats.
double AllowedLevelsContinuity(const std::vector<double>& reference,
                               const std::vector<double>& detected) {
  std::vector<std::vector<double>> variants(5);
  for (size_t i = 0; i < reference.size(); ++i) {
    variants[0].push_back(reference[i]);
    variants[i % 2 == 0 ? 2 : 3].push_back(reference[i]);
    if (i + 1 < reference.size()) {
      const double half = 0.5 * (reference[i] + reference[i + 1]);
      variants[1].push_back(reference[i]);
      variants[1].push_back(half);
      variants[4].push_back(half);
    }
  }
  double best = 0;
  for (const auto& v : variants) best = std::max(best, Continuity(v, detected));
  return best;
}

struct Setup {
  const char* name;
  bool ranged;
  apm::TempoPrior prior;
};

struct Scores {
  double f = 0, amlt = 0;
  int precise_within = 0, tracker_within = 0, right_level = 0, constant = 0;
  std::vector<double> precise_error, tracker_error;
};

double Median(std::vector<double> v) {
  if (v.empty()) return NAN;
  std::nth_element(v.begin(), v.begin() + v.size() / 2, v.end());
  return v[v.size() / 2];
}

}  // namespace

int main(int argc, char** argv) {
  const bool per_track = argc > 1 && strcmp(argv[1], "--tracks") == 0;
  const Setup setups[] = {{"defaults", false, apm::TempoPrior::kGeometricMiddle},
                          {"range, geometric-middle prior", true,
                           apm::TempoPrior::kGeometricMiddle},
                          {"range, flat prior", true, apm::TempoPrior::kFlat}};
  const apm::AnalysisFrameRate rate = apm::FrameRateAt(kRate);
  std::vector<Scores> scores(std::size(setups));
  const int pieces = static_cast<int>(std::size(kPieces));
  for (int k = 0; k < pieces; ++k) {
    const Piece& piece = kPieces[k];
    const Track track = Synthesise(piece, 1000 + k);
    const double truth = piece.bpm;
    for (size_t s = 0; s < std::size(setups); ++s) {
      const double middle = piece.second_bpm > 0 ? std::sqrt(piece.bpm * piece.second_bpm)
                                                 : piece.bpm;
      const apm::ApmConfig config =
          setups[s].ranged
              ? apm::ConfigForTempoRange(middle / 1.3, middle * 1.3, setups[s].prior)
              : apm::ApmConfig();
      apm::AudioAnalyzer analyzer(kRate, config);
      const int32_t n = analyzer.CalculateBeats(
          reinterpret_cast<const uint8_t*>(track.pcm.data()),
          static_cast<int32_t>(2 * track.pcm.size()), 1, nullptr);
      std::vector<double> beats;
      for (int32_t i = 0; i < n; ++i) {
        beats.push_back(std::round(analyzer.beats()[i] * rate.frames_per_second) /
                        rate.true_frames_per_second);
      }
      Scores& sc = scores[s];
      const double f = FMeasure(track.beats, beats);
      const double amlt = AllowedLevelsContinuity(track.beats, beats);
      sc.f += f / pieces;
      sc.amlt += amlt / pieces;
      const double precise = apm::PreciseTempo(beats);
      const double tracker = analyzer.bpm();
      if (piece.second_bpm == 0) {
        ++sc.constant;
        // An unknown tempo counts as wrong by 100 %.
        const double pe = std::isfinite(precise) ? std::fabs(precise / truth - 1) : 1.0;
        const double te = tracker > 0 ? std::fabs(tracker / truth - 1) : 1.0;
        sc.precise_error.push_back(pe);
        sc.tracker_error.push_back(te);
        if (pe <= 0.04) {
          ++sc.right_level;
          sc.precise_within += pe <= 0.005;
          sc.tracker_within += te <= 0.005;
        }
      }
      if (per_track) {
        printf("%-18s %-30s F %.3f AMLt %.3f tempo %7.2f tracker %7.2f\n", piece.name,
               setups[s].name, f, amlt, precise, tracker);
      }
    }
  }
  printf("| set-up | F-measure | AMLt | at the right level | precise tempo within 0.5 %% "
         "| tracker tempo within 0.5 %% | median tempo error, precise / tracker |\n");
  printf("|---|---|---|---|---|---|---|\n");
  for (size_t s = 0; s < std::size(setups); ++s) {
    const Scores& sc = scores[s];
    printf("| %s | %.3f | %.3f | %d of %d | %d of %d | %d of %d | %.2f %% / %.2f %% |\n",
           setups[s].name, sc.f, sc.amlt, sc.right_level, sc.constant, sc.precise_within,
           sc.right_level, sc.tracker_within, sc.right_level,
           100 * Median(sc.precise_error), 100 * Median(sc.tracker_error));
  }
  return 0;
}
