// Beat times of a few synthesised grooves, fixed to the bit on every target
// and compiler: the grooves are made with integer arithmetic only.
// Synthesise is the recipe of the goldens; a failure prints the listing to
// paste after an intended change.
#include <gtest/gtest.h>

#include <algorithm>
#include <cinttypes>
#include <cstdio>
#include <cstring>
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
  int32_t sample_rate, channel_count, seconds, bpm;
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
  uint32_t kick_phase = 0, note_phase = 0;
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
      const int64_t v = g.channel_count == 1 ? mono : c == 0 ? left : right;
      const uint16_t bits = static_cast<uint16_t>(test_signals::Clamp16(v));
      const size_t at = static_cast<size_t>((i * g.channel_count + c) * 2);
      pcm[at] = static_cast<uint8_t>(bits & 0xFF);
      pcm[at + 1] = static_cast<uint8_t>(bits >> 8);
    }
  }
  return pcm;
}

// Six beats a line, as the goldens below are written.
std::string Listing(const std::vector<uint32_t>& bits) {
  std::string text;
  for (size_t i = 0; i < bits.size(); ++i) {
    char value[16];
    std::snprintf(value, sizeof value, "0x%08" PRIx32 ",", bits[i]);
    text += (i % 6 == 0 ? "      " : " ") + std::string(value) + (i % 6 == 5 ? "\n" : "");
  }
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
  EXPECT_EQ(g.beat_bits, bits) << "Beats now:\n" << Listing(bits);
  // Tells whether a difference starts before the tracker.
  const std::vector<float>& detection = analyzer.detection_function();
  const uint64_t fingerprint =
      test_signals::Fnv1a(detection.data(), detection.size() * sizeof(float));
  EXPECT_EQ(g.detection_fingerprint, fingerprint)
      << "the detection function differs: 0x" << std::hex << fingerprint;
  // The goldens are real beats: the tracker found the groove's tempo.
  EXPECT_NEAR(analyzer.bpm(), g.bpm, g.bpm * 0.03);
}

const Groove kGrooves[] = {
    {"Kick120Mono44k", 44100, 1, 6, 120, 1, true, true, false, false, false,
     0xb3afc557d80a0259u,
     {
      0x00000000, 0x3efae148, 0x3f7ae148, 0x3fbc28f6, 0x3ffd70a4, 0x401eb852,
      0x403eb852, 0x405eb852, 0x407eb852, 0x408f5c29, 0x409f5c29, 0x40af5c29,
     }},
    {"Band100Stereo22k", 22050, 2, 8, 100, 2, true, true, true, false, false,
     0x9fb801a1efc3f9c9u,
     {
      0x00000000, 0x3f1890cf, 0x3f9890cf, 0x3fe4d936, 0x401890cf, 0x40400000,
      0x4066c9b2, 0x4086c9b2, 0x409a2e8c, 0x40ad9365, 0x40c0f83e, 0x40d45d17,
      0x40e7c1f0, 0x40fb26ca,
     }},
    {"Notes140Mono8k", 8000, 1, 10, 140, 3, false, false, true, false, false,
     0x7e2ff2e6ca4b79acu,
     {
      0x00000000, 0x3ed70a3d, 0x3f570a3d, 0x3fa147ae, 0x3fd70a3d, 0x4007ae14,
      0x40233333, 0x403eb852, 0x405a3d71, 0x4075c28f, 0x4088a3d7, 0x40966666,
      0x40a428f6, 0x40b1eb85, 0x40bfae14, 0x40cd70a4, 0x40db3333, 0x40e8f5c3,
      0x40f6b852, 0x41023d71, 0x41091eb8, 0x41100000, 0x4116e148, 0x411dc28f,
     }},
    {"Kick87Stereo16k", 16000, 2, 7, 87, 4, true, false, true, false, false,
     0x6d8f203f6bb82e0cu,
     {
      0x00000000, 0x3f2e147b, 0x3fae147b, 0x40028f5c, 0x402f5c29, 0x405b851f,
      0x4083d70a, 0x4099eb85, 0x40b00000, 0x40c6147b, 0x40dc28f6,
     }},
    {"Strings110Stereo44k", 44100, 2, 12, 110, 5, false, false, false, true, false,
     0x0b85428081268cd1u,
     {
      0x00000000, 0x3f0ccccd, 0x3f8ccccd, 0x3fd33333, 0x400ccccd, 0x40300000,
      0x40533333, 0x40766666, 0x408ccccd, 0x409e6666, 0x40b00000, 0x40c1999a,
      0x40d33333, 0x40e4cccd, 0x40f66666, 0x41040000, 0x410ccccd, 0x4115999a,
      0x411e6666, 0x41273333, 0x41300000, 0x4138cccd,
     }},
    {"SoftPiano96Mono22k", 22050, 1, 10, 96, 6, false, false, false, false, true,
     0x52670d84b00e5fabu,
     {
      0x00000000, 0x3f2052bf, 0x3fa052bf, 0x3ff07c1f, 0x402052bf, 0x4048676f,
      0x40707c1f, 0x408c4867, 0x40a052bf, 0x40b45d17, 0x40c90cee, 0x40dd6a05,
      0x40f1c71c, 0x4103121a, 0x410d40a5, 0x41176f31,
     }},
};

INSTANTIATE_TEST_SUITE_P(Grooves, GoldenBeats, testing::ValuesIn(kGrooves),
                         [](const testing::TestParamInfo<Groove>& info) {
                           return std::string(info.param.name);
                         });

}  // namespace
}  // namespace apm
