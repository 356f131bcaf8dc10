#include "tools/beat_view.h"

#include <cmath>
#include <utility>

namespace cwtool {
namespace {

// 4 ms: a zoomed-in view of two seconds still gets a bucket every few
// pixels, and five minutes stay well under a megabyte of page.
constexpr int32_t kEnvelopePerSecond = 250;

}  // namespace

bool KnownTempo(double bpm) { return std::isfinite(bpm) && bpm > 0; }

BeatViewSignal::BeatViewSignal(int32_t sample_rate, int32_t channels, bool with_audio)
    : envelope_(sample_rate, channels, kEnvelopePerSecond) {
  if (!with_audio) return;
  encoder_ = std::make_unique<CompactAudioEncoder>();
  // A failure to start the encoder fails the page only, when it is made.
  if (!encoder_->Open(sample_rate, channels, &encoder_error_)) encoder_.reset();
}

void BeatViewSignal::Add(const int16_t* frames, int64_t count) {
  envelope_.Add(frames, count);
  if (encoder_ && !encoder_->Add(frames, count, &encoder_error_)) encoder_.reset();
}

bool BeatViewSignal::MakeView(const BeatResult& result, std::vector<float> onset,
                              double onset_per_second, BeatView* view,
                              std::string* error) {
  view->file = result.path;
  view->duration = result.duration;
  view->sample_rate = result.sample_rate;
  view->channels = result.channels;
  view->tempo = result.tempo;
  view->tracker_tempo = result.bpm;
  view->beats = result.beats;
  view->envelope_per_second = kEnvelopePerSecond;
  envelope_.Take(&view->envelope_low, &view->envelope_high);
  view->onset_per_second = onset_per_second;
  view->onset = std::move(onset);
  if (!encoder_error_.empty()) {
    *error = encoder_error_;
    return false;
  }
  if (encoder_) {
    if (!encoder_->Finish(&view->audio, error)) return false;
    view->audio_mime = CompactAudioEncoder::kMime;
  }
  return true;
}

}  // namespace cwtool
