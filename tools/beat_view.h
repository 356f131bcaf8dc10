// Everything the beat views draw of one analysed file, gathered once so that
// the SVG plot and the HTML page are plain functions of it.
#ifndef CLIPWEAVER_TOOLS_BEAT_VIEW_H_
#define CLIPWEAVER_TOOLS_BEAT_VIEW_H_

#include <cstdint>
#include <string>
#include <vector>

#include "tools/audio_file.h"
#include "tools/beat_analysis.h"

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
  int32_t onset_per_second = 0;
  std::vector<float> onset;
  // The track itself, compactly encoded; empty when not wanted.
  std::string audio_mime;
  std::string audio;
};

// Whether a tempo field holds a figure.
bool KnownTempo(double bpm);

// The view of an analysed file, without the audio.
BeatView MakeBeatView(const BeatResult& result, const DecodedAudio& audio,
                      const std::vector<float>& onset, int32_t onset_per_second);

// Fills in view->audio; on failure *error says why.
bool AddCompactAudio(const DecodedAudio& audio, BeatView* view, std::string* error);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_BEAT_VIEW_H_
