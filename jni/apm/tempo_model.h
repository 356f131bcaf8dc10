// The score tables of the tracker's model, all natural logarithms so that
// scores add up along a path.
#ifndef CLIPWEAVER_JNI_APM_TEMPO_MODEL_H_
#define CLIPWEAVER_JNI_APM_TEMPO_MODEL_H_

#include <cstdint>
#include <vector>

namespace apm {

// Added before every logarithm of the model, so a vanishing term scores
// log(1e-5) instead of minus infinity.
constexpr double kLogFloor = 1e-5;

// log(weight * g(d) + kLogFloor) for d = 0 .. size - 1, g being a Gaussian
// of standard deviation sigma_ms over d grid steps of step_ms: the score of
// a change of period or of phase by d frames.
std::vector<double> TransitionScores(int32_t size, double weight,
                                     double step_ms, double sigma_ms);

// For every lag, weight * log(kLogFloor + Gaussian(z)), z being the decimal
// logarithm of the period over center_ms in units of width: prefers
// periods near the centre.
std::vector<double> TempoPrior(const std::vector<int32_t>& lag_frames,
                               double frames_per_second, double center_ms,
                               double width, double weight);

}  // namespace apm

#endif  // CLIPWEAVER_JNI_APM_TEMPO_MODEL_H_
