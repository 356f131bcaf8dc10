// Everything the beat views draw of one analysed file, gathered once so that
// the SVG plot and the HTML page are plain functions of it.
#ifndef CLIPWEAVER_TOOLS_BEAT_VIEW_H_
#define CLIPWEAVER_TOOLS_BEAT_VIEW_H_

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "tools/beat_analysis.h"
#include "tools/compact_audio.h"
#include "tools/wave_envelope.h"

namespace cwtool {

struct BeatView {
  std::string file;
  double duration = 0;  // seconds
  int32_t sample_rate = 0;
  int32_t channels = 0;
  double tempo = 0;          // BPM; NaN or 0: unknown
  double tracker_tempo = 0;  // the beat tracker's own figure; NaN or 0: unknown
  std::vector<float> beats;  // seconds
  // Lowest and highest channel mean (-1..1) per envelope bucket.
  int32_t envelope_per_second = 0;
  std::vector<float> envelope_low, envelope_high;
  // The conditioned onset strength, one value per analysis frame.
  double onset_per_second = 0;
  std::vector<float> onset;
  // The track itself, compactly encoded; empty when not wanted.
  std::string audio_mime;
  std::string audio;
};

// Whether a tempo field holds a figure.
bool KnownTempo(double bpm);

// What the views draw of the signal, gathered block by block while the file
// streams through the analysis, so that the signal is never held whole.
class BeatViewSignal {
 public:
  // The compact audio is encoded only when with_audio.
  BeatViewSignal(int32_t sample_rate, int32_t channels, bool with_audio);

  // Interleaved 16-bit frames, in order, in blocks of any size.
  void Add(const int16_t* frames, int64_t count);
  // The view of the analysed file, once: the signal's data move into it.
  // On failure *error says why.
  bool MakeView(const BeatResult& result, std::vector<float> onset,
                double onset_per_second, BeatView* view, std::string* error);

 private:
  WaveEnvelope envelope_;
  std::unique_ptr<CompactAudioEncoder> encoder_;  // null: no audio wanted
  std::string encoder_error_;
};

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_BEAT_VIEW_H_
