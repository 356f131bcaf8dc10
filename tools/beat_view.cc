#include "tools/beat_view.h"

#include <cmath>

#include "tools/compact_audio.h"
#include "tools/wave_envelope.h"

namespace cwtool {
namespace {

// 4 ms: a zoomed-in view of two seconds still gets a bucket every few
// pixels, and five minutes stay well under a megabyte of page.
constexpr int32_t kEnvelopePerSecond = 250;

}  // namespace

bool KnownTempo(double bpm) { return std::isfinite(bpm) && bpm > 0; }

BeatView MakeBeatView(const BeatResult& result, const DecodedAudio& audio,
                      const std::vector<float>& onset, int32_t onset_per_second) {
  BeatView view;
  view.file = result.path;
  view.duration = result.duration;
  view.sample_rate = result.sample_rate;
  view.channels = result.channels;
  // Until a tempo of its own is measured, the tracker's figure stands for
  // both.
  view.tempo = result.bpm;
  view.tracker_tempo = result.bpm;
  view.beats = result.beats;
  WaveEnvelope envelope(audio.sample_rate, audio.channels, kEnvelopePerSecond);
  envelope.Add(audio.samples.data(), audio.frames());
  view.envelope_per_second = kEnvelopePerSecond;
  view.envelope_low = envelope.low();
  view.envelope_high = envelope.high();
  view.onset_per_second = onset_per_second;
  view.onset = onset;
  return view;
}

bool AddCompactAudio(const DecodedAudio& audio, BeatView* view, std::string* error) {
  CompactAudioEncoder encoder;
  if (!encoder.Open(audio.sample_rate, audio.channels, error) ||
      !encoder.Add(audio.samples.data(), audio.frames(), error) ||
      !encoder.Finish(&view->audio, error)) {
    return false;
  }
  view->audio_mime = CompactAudioEncoder::kMime;
  return true;
}

}  // namespace cwtool
