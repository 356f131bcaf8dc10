// One output frame of the stereo path: both channels interpolated between
// two neighbouring input frames, gained and mixed into the output, held in
// one register where the target has SSE2. Gains must be below 65536 in
// magnitude (and not NaN), so that every product converts exactly; the
// caller takes the scalar path for the others.
#ifndef CLIPWEAVER_RESAMPLER_STEREO_FRAME_H_
#define CLIPWEAVER_RESAMPLER_STEREO_FRAME_H_

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "base/instruction_set.h"

#if defined(CLIPWEAVER_SSE2)
#include <emmintrin.h>
#endif

namespace norvane {

#if defined(CLIPWEAVER_SSE2)

struct StereoGains {
  explicit StereoGains(float left, float right) : v(_mm_setr_ps(left, right, 0, 0)) {}
  __m128 v;
};

// older + ((newer - older) w >> 15) as (older (32767 - w) + newer w + older) >> 15:
// the older term is a multiple of 2^15, so the shift floors the same way,
// and the pair products fit one multiply-add of 16-bit lanes.
inline void MixStereoFrame(int16_t* out, const int16_t* in, size_t sample, uint32_t fraction,
                           const StereoGains& gains) {
  int64_t frames;
  std::memcpy(&frames, reinterpret_cast<const char*>(in) + 2 * sample, sizeof(frames));
  const __m128i pairs = _mm_shufflelo_epi16(_mm_cvtsi64_si128(frames), _MM_SHUFFLE(3, 1, 2, 0));
  const int32_t w = static_cast<int32_t>(fraction >> 15);
  const __m128i weights = _mm_set1_epi32(static_cast<int32_t>(static_cast<uint32_t>(w) << 16) |
                                         (32767 - w));
  const __m128i older = _mm_srai_epi32(_mm_slli_epi32(pairs, 16), 16);
  const __m128i value =
      _mm_srai_epi32(_mm_add_epi32(_mm_madd_epi16(pairs, weights), older), 15);
  const __m128i gained = _mm_cvttps_epi32(_mm_mul_ps(_mm_cvtepi32_ps(value), gains.v));
  // The sums keep the low 16 bits, as the scalar mix does.
  const __m128i low = _mm_shufflelo_epi16(gained, _MM_SHUFFLE(3, 3, 2, 0));
  int32_t mixed;
  std::memcpy(&mixed, out, sizeof(mixed));
  mixed = _mm_cvtsi128_si32(_mm_add_epi16(_mm_cvtsi32_si128(mixed), low));
  std::memcpy(out, &mixed, sizeof(mixed));
}

#else

struct StereoGains {
  explicit StereoGains(float left, float right) : v{left, right} {}
  float v[2];
};

inline void MixStereoFrame(int16_t* out, const int16_t* in, size_t sample, uint32_t fraction,
                           const StereoGains& gains) {
  int16_t frames[4];
  std::memcpy(frames, reinterpret_cast<const char*>(in) + 2 * sample, sizeof(frames));
  const int32_t w = static_cast<int32_t>(fraction >> 15);
  for (int c = 0; c < 2; ++c) {
    const int32_t value = frames[c] + (((frames[c + 2] - frames[c]) * w) >> 15);
    const int32_t gained = static_cast<int32_t>(static_cast<float>(value) * gains.v[c]);
    out[c] = static_cast<int16_t>(static_cast<uint16_t>(static_cast<uint32_t>(out[c]) +
                                                        static_cast<uint32_t>(gained)));
  }
}

#endif

}  // namespace norvane

#endif  // CLIPWEAVER_RESAMPLER_STEREO_FRAME_H_
