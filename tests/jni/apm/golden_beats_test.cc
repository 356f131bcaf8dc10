// Beat times of a few synthesised grooves, fixed to the bit. The grooves are
// made with integer arithmetic only, so the input is the same everywhere;
// the beats must then come out the same on every target and compiler too.
#include <gtest/gtest.h>

#include <algorithm>
#include <cinttypes>
#include <cstdio>
#include <cstring>
#include <ostream>
#include <string>
#include <vector>

#include "jni/apm/audio_analyzer.h"
#include "tests/test_signals.h"

namespace apm {
namespace {

using test_signals::Decay;
using test_signals::Noise;
using test_signals::PhaseStep;
using test_signals::Triangle;

struct Groove {
  const char* name;
  int32_t sample_rate;
  int32_t channel_count;
  int32_t seconds;
  int32_t bpm;
  uint32_t seed;
  bool kick;   // low thump with a noise attack on every beat
  bool hats;   // short noise bursts half way between beats
  bool notes;  // a triangle-wave note from every beat, pitch cycling per bar
  // A sustained chord per bar, fading in over a beat as the last one fades
  // out, with a slight swell on every beat: weak onsets, many near ties.
  bool strings;
  // Soft notes with a 5 ms attack ringing over two beats, resting on every
  // eighth beat.
  bool piano;
  uint64_t detection_fingerprint;
  std::vector<uint32_t> beat_bits;  // beat times as float bits
};

// Interleaved little-endian 16-bit PCM. In stereo the kick leans left and
// the hats right, so the mix-down has something to do.
std::vector<uint8_t> Synthesise(const Groove& g) {
  static const int32_t kNoteHertz[] = {110, 147, 131, 165};
  const int64_t rate = g.sample_rate;
  const int64_t frames = rate * g.seconds;
  const int64_t kick_length = rate / 8;
  const int64_t hat_length = rate / 40;
  const uint32_t kick_step = PhaseStep(55, g.sample_rate);
  Noise noise(g.seed);
  std::vector<uint8_t> pcm(static_cast<size_t>(frames * g.channel_count * 2));
  uint32_t kick_phase = 0;
  uint32_t note_phase = 0;
  int64_t beat = 0;
  for (int64_t i = 0; i < frames; ++i) {
    // Beat b starts at sample b * rate * 60 / bpm, rounded down.
    while ((beat + 1) * rate * 60 / g.bpm <= i) ++beat;
    const int64_t beat_start = beat * rate * 60 / g.bpm;
    const int64_t beat_length = (beat + 1) * rate * 60 / g.bpm - beat_start;
    const int64_t since = i - beat_start;
    if (since == 0) kick_phase = 0;
    const int32_t n = noise.Next();
    int64_t left = n / 64;  // a quiet floor
    int64_t right = left;
    if (g.kick) {
      const int64_t thump =
          Triangle(kick_phase) * Decay(since, kick_length) / 65536 / 2;
      const int64_t click = n * Decay(since, kick_length / 16) / 65536 / 3;
      // The first beat of each bar is stronger.
      const int64_t accent = beat % 4 == 0 ? 4 : 3;
      left += (thump + click) * accent / 4;
      right += (thump + click) * accent / 8;
    }
    if (g.hats) {
      const int64_t hat =
          n * Decay(since - beat_length / 2, hat_length) / 65536 / 5;
      left += hat / 2;
      right += hat;
    }
    if (g.notes) {
      if (since == 0) note_phase = 0;
      const int64_t tone =
          Triangle(note_phase) * Decay(since, beat_length) / 65536 / 3;
      left += tone;
      right += tone;
      note_phase += PhaseStep(kNoteHertz[(beat / 4) % 4], g.sample_rate);
    }
    if (g.strings) {
      static const int32_t kChords[4][3] = {
          {220, 277, 330}, {196, 247, 294}, {175, 220, 262}, {196, 247, 294}};
      const int64_t bar_start = (beat / 4) * 4 * rate * 60 / g.bpm;
      const int64_t rise = std::min(i - bar_start, beat_length) * 65536 / beat_length;
      const auto chord = [&](int64_t bar) {
        int64_t sum = 0;
        for (int32_t hertz : kChords[bar % 4]) {
          sum += Triangle(static_cast<uint32_t>(i) * PhaseStep(hertz, g.sample_rate));
        }
        return sum / 3;
      };
      const int64_t bow = 65536 + Decay(since, beat_length / 2) / 4;
      const int64_t tone =
          (chord(beat / 4) * rise + chord(beat / 4 + 3) * (65536 - rise)) / 65536;
      left += tone * bow / 65536 / 4;
      right += tone * bow / 65536 / 5;
    }
    if (g.piano) {
      static const int32_t kPianoHertz[8] = {262, 330, 392, 330, 294, 349, 440, 0};
      const int64_t attack = rate / 200;
      for (int64_t back = 0; back < 2 && back <= beat; ++back) {
        const int32_t hertz = kPianoHertz[(beat - back) % 8];
        const int64_t from = (beat - back) * rate * 60 / g.bpm;
        const int64_t at = i - from;
        if (hertz == 0) continue;
        const int64_t note = Triangle(static_cast<uint32_t>(at) * PhaseStep(hertz, g.sample_rate)) *
                             Decay(at, 2 * beat_length) / 65536 * std::min(at, attack) / attack;
        left += note / 10;
        right += note / 10;
      }
    }
    kick_phase += kick_step;
    const int64_t mono = (left + right) / 2;
    for (int32_t c = 0; c < g.channel_count; ++c) {
      int64_t v = g.channel_count == 1 ? mono : c == 0 ? left : right;
      v = v < -32768 ? -32768 : v > 32767 ? 32767 : v;
      const uint16_t bits = static_cast<uint16_t>(static_cast<int16_t>(v));
      const size_t at = static_cast<size_t>((i * g.channel_count + c) * 2);
      pcm[at] = static_cast<uint8_t>(bits & 0xFF);
      pcm[at + 1] = static_cast<uint8_t>(bits >> 8);
    }
  }
  return pcm;
}

void PrintTo(const Groove& g, std::ostream* out) { *out << g.name; }

// One line per beat: its bits and, for reading, its value.
std::string Listing(const std::vector<uint32_t>& bits) {
  std::string text;
  for (uint32_t b : bits) {
    float seconds;
    std::memcpy(&seconds, &b, sizeof seconds);
    char line[48];
    std::snprintf(line, sizeof line, "0x%08" PRIx32 ",  // %.9g\n", b,
                  static_cast<double>(seconds));
    text += line;
  }
  return text;
}

// FNV-1a over the bytes of the values.
uint64_t Fingerprint(const std::vector<float>& values) {
  uint64_t hash = 0xcbf29ce484222325u;
  const auto* bytes = reinterpret_cast<const unsigned char*>(values.data());
  for (size_t i = 0; i < values.size() * sizeof(float); ++i) {
    hash = (hash ^ bytes[i]) * 0x100000001b3u;
  }
  return hash;
}

std::string Hex(uint64_t value) {
  char text[24];
  std::snprintf(text, sizeof text, "0x%016" PRIx64, value);
  return text;
}

class GoldenBeats : public testing::TestWithParam<Groove> {};

TEST_P(GoldenBeats, MatchBitForBit) {
  const Groove& g = GetParam();
  const std::vector<uint8_t> pcm = Synthesise(g);
  AudioAnalyzer analyzer(g.sample_rate);
  testing::internal::CaptureStderr();
  const int32_t count = analyzer.CalculateBeats(
      pcm.data(), static_cast<int32_t>(pcm.size()), g.channel_count, nullptr);
  testing::internal::GetCapturedStderr();
  ASSERT_GE(count, 0);
  std::vector<uint32_t> bits(static_cast<size_t>(count));
  if (count > 0) std::memcpy(bits.data(), analyzer.beats(), bits.size() * 4);
  const std::string beats = Listing(bits);
  EXPECT_EQ(Listing(g.beat_bits), beats) << "Beats now:\n" << beats;
  // Tells whether a difference starts before the tracker.
  EXPECT_EQ(Hex(g.detection_fingerprint),
            Hex(Fingerprint(analyzer.detection_function())))
      << "the detection function differs";
  // The goldens are real beats: the tracker found the groove's tempo.
  EXPECT_NEAR(analyzer.bpm(), g.bpm, g.bpm * 0.03);
}

const Groove kGrooves[] = {
    {"Kick120Mono44k", 44100, 1, 6, 120, 1, true, true, false, false, false,
     0xb3afc557d80a0259u,
     {
      0x00000000,  // 0
      0x3efae148,  // 0.49000001
      0x3f7ae148,  // 0.980000019
      0x3fbc28f6,  // 1.47000003
      0x3ffd70a4,  // 1.98000002
      0x401eb852,  // 2.48000002
      0x403eb852,  // 2.98000002
      0x405eb852,  // 3.48000002
      0x407eb852,  // 3.98000002
      0x408f5c29,  // 4.48000002
      0x409f5c29,  // 4.98000002
      0x40af5c29,  // 5.48000002
     }},
    {"Band100Stereo22k", 22050, 2, 8, 100, 2, true, true, true, false, false,
     0x9fb801a1efc3f9c9u,
     {
      0x00000000,  // 0
      0x3f1890cf,  // 0.595959604
      0x3f9890cf,  // 1.19191921
      0x3fe4d936,  // 1.78787875
      0x401890cf,  // 2.38383842
      0x40400000,  // 3
      0x4066c9b2,  // 3.6060605
      0x4086c9b2,  // 4.21212101
      0x409a2e8c,  // 4.81818199
      0x40ad9365,  // 5.4242425
      0x40c0f83e,  // 6.030303
      0x40d45d17,  // 6.63636351
      0x40e7c1f0,  // 7.24242401
      0x40fb26ca,  // 7.84848499
     }},
    {"Notes140Mono8k", 8000, 1, 10, 140, 3, false, false, true, false, false,
     0x7e2ff2e6ca4b79acu,
     {
      0x00000000,  // 0
      0x3ed70a3d,  // 0.419999987
      0x3f570a3d,  // 0.839999974
      0x3fa147ae,  // 1.25999999
      0x3fd70a3d,  // 1.67999995
      0x4007ae14,  // 2.11999989
      0x40233333,  // 2.54999995
      0x403eb852,  // 2.98000002
      0x405a3d71,  // 3.41000009
      0x4075c28f,  // 3.83999991
      0x4088a3d7,  // 4.26999998
      0x40966666,  // 4.69999981
      0x40a428f6,  // 5.13000011
      0x40b1eb85,  // 5.55999994
      0x40bfae14,  // 5.98999977
      0x40cd70a4,  // 6.42000008
      0x40db3333,  // 6.8499999
      0x40e8f5c3,  // 7.28000021
      0x40f6b852,  // 7.71000004
      0x41023d71,  // 8.14000034
      0x41091eb8,  // 8.56999969
      0x41100000,  // 9
      0x4116e148,  // 9.43000031
      0x411dc28f,  // 9.85999966
     }},
    {"Kick87Stereo16k", 16000, 2, 7, 87, 4, true, false, true, false, false,
     0x6d8f203f6bb82e0cu,
     {
      0x00000000,  // 0
      0x3f2e147b,  // 0.680000007
      0x3fae147b,  // 1.36000001
      0x40028f5c,  // 2.03999996
      0x402f5c29,  // 2.74000001
      0x405b851f,  // 3.43000007
      0x4083d70a,  // 4.11999989
      0x4099eb85,  // 4.80999994
      0x40b00000,  // 5.5
      0x40c6147b,  // 6.19000006
      0x40dc28f6,  // 6.88000011
     }},
    {"Strings110Stereo44k", 44100, 2, 12, 110, 5, false, false, false, true, false,
     0x0b85428081268cd1u,
     {
      0x00000000,  // 0
      0x3f0ccccd,  // 0.550000012
      0x3f8ccccd,  // 1.10000002
      0x3fd33333,  // 1.64999998
      0x400ccccd,  // 2.20000005
      0x40300000,  // 2.75
      0x40533333,  // 3.29999995
      0x40766666,  // 3.8499999
      0x408ccccd,  // 4.4000001
      0x409e6666,  // 4.94999981
      0x40b00000,  // 5.5
      0x40c1999a,  // 6.05000019
      0x40d33333,  // 6.5999999
      0x40e4cccd,  // 7.1500001
      0x40f66666,  // 7.69999981
      0x41040000,  // 8.25
      0x410ccccd,  // 8.80000019
      0x4115999a,  // 9.35000038
      0x411e6666,  // 9.89999962
      0x41273333,  // 10.4499998
      0x41300000,  // 11
      0x4138cccd,  // 11.5500002
     }},
    {"SoftPiano96Mono22k", 22050, 1, 10, 96, 6, false, false, false, false, true,
     0x52670d84b00e5fabu,
     {
      0x00000000,  // 0
      0x3f2052bf,  // 0.626262605
      0x3fa052bf,  // 1.25252521
      0x3ff07c1f,  // 1.87878788
      0x402052bf,  // 2.50505042
      0x4048676f,  // 3.13131309
      0x40707c1f,  // 3.75757575
      0x408c4867,  // 4.38383818
      0x40a052bf,  // 5.01010084
      0x40b45d17,  // 5.63636351
      0x40c90cee,  // 6.28282833
      0x40dd6a05,  // 6.91919184
      0x40f1c71c,  // 7.55555534
      0x4103121a,  // 8.19191933
      0x410d40a5,  // 8.82828236
      0x41176f31,  // 9.46464634
     }},
};

INSTANTIATE_TEST_SUITE_P(Grooves, GoldenBeats, testing::ValuesIn(kGrooves),
                         [](const testing::TestParamInfo<Groove>& info) {
                           return std::string(info.param.name);
                         });

}  // namespace
}  // namespace apm
