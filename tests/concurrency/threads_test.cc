// Analyses and resamplers on several threads at once share nothing but the
// log facility and the resampler load counter: every thread must get the
// single-threaded results, and the counter must return to where it started.
#include <gtest/gtest.h>

#include <memory>
#include <thread>
#include <vector>

#include "jni/apm/audio_analyzer.h"
#include "resampler/audio_resampler.h"
#include "tests/test_signals.h"

namespace {

std::vector<float> Beats(const std::vector<int16_t>& pcm, int rate) {
  apm::AudioAnalyzer analyzer(rate);
  const int32_t n = analyzer.CalculateBeats(
      reinterpret_cast<const uint8_t*>(pcm.data()), static_cast<int32_t>(2 * pcm.size()), 1,
      [](char) { return false; });
  return n > 0 ? std::vector<float>(analyzer.beats(), analyzer.beats() + n)
               : std::vector<float>();
}

std::vector<int16_t> Resampled(int32_t to) {
  std::unique_ptr<norvane::AudioResampler> resampler(norvane::AudioResampler::create(
      16, 2, to, norvane::AudioResampler::QUALITY_DEFAULT, false));
  resampler->setSourceSampleRate(44100);
  resampler->setVolume(0.5f, 1.0f);
  std::vector<int16_t> in(2 * 8820);
  for (size_t i = 0; i < in.size(); ++i) in[i] = static_cast<int16_t>(i * 17 % 20000);
  std::vector<int16_t> out(resampler->getOutputSampleCount(8820));
  resampler->resample(out.data(), in.data(), 8820);
  return out;
}

TEST(Threads, AnalysesAndResamplersMatchTheirSingleThreadedResults) {
  const uint32_t load_before = norvane::AudioResampler::getCurrentLoadMHz();
  const int kThreads = 6;
  std::vector<std::vector<int16_t>> tracks, resampled;
  std::vector<std::vector<float>> beats;
  testing::internal::CaptureStderr();
  for (int i = 0; i < kThreads; ++i) {
    tracks.push_back(test_signals::Clicks(8000, 1, 6, 0.4 + 0.05 * i));
    beats.push_back(Beats(tracks[i], 8000));
    EXPECT_FALSE(beats[i].empty()) << i;
    resampled.push_back(Resampled(48000 - 4000 * i));
  }
  std::vector<std::thread> threads;
  for (int i = 0; i < kThreads; ++i) {
    threads.emplace_back([&, i] {
      for (int round = 0; round < 3; ++round) {
        EXPECT_TRUE(Beats(tracks[i], 8000) == beats[i]) << i;
        EXPECT_TRUE(Resampled(48000 - 4000 * i) == resampled[i]) << i;
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  testing::internal::GetCapturedStderr();
  EXPECT_EQ(norvane::AudioResampler::getCurrentLoadMHz(), load_before);
}

}  // namespace
