// Constant tables of the delay networks: the lengths of lines 0..19 and of the six early-reflection lines
// at the 29761 Hz reference rate and room size 50, their coefficients, the modulated plate's depths and
// rates, and the output taps. Read by network sizing and by the kernels' readiness check.
#pragma once

namespace ulvetta {
namespace network {

constexpr int kReferenceRate = 29761;  // Hz

// Network lines 0..19: length in samples at the reference rate and room size 50, and coefficient.
constexpr int kBaseLength[20] = {142,  107,  379,  277,  672,  4453, 1800, 3720, 908,  4217,
                                 2656, 3163, 2763, 3567, 7027, 3497, 9173, 5211, 4689, 6713};
constexpr double kGain[20] = {0.81, 0.81, 0.71, 0.71, 0.7, 0, 0.5, 0, 0.7, 0, 0.5, 0, 0, 0, 0, 0, 0, 0, 0, 0};

// The modulated plate uses lines 0..11 with these gains, depths (samples at the reference) and rates (Hz).
constexpr double kMode1Gain[12] = {0.75, 0.75, 0.625, 0.625, 0.7, 0, 0.5, 0, 0.7, 0, 0.5, 0};
constexpr int kMode1Depth[12] = {0, 0, 0, 0, 2, 5, 7, 9, 3, 7, 7, 4};
constexpr double kMode1Rate[12] = {0, 0, 0, 0, 0.5, 0.3, 0.7, 0.1, 0.3, 0.27, 0.21, 0.08};

// Early-reflection lines; the gains are the single-precision values of 0.7, -0.65, -0.7 and 0.8.
constexpr int kEarlyBaseLength[6] = {342, 619, 59, 39, 518, 379};
constexpr double kEarlyGain[6] = {0.699999988079071, -0.6499999761581421, 0.0, 0.0, -0.699999988079071,
                                  0.800000011920929};

// Output tap i reads line kTapLine[i] at kTapPosition[i] samples (unscaled; wrapped into short lines).
// Taps 0..13 serve every delay-network kernel, 14..19 only the twenty-line plates.
constexpr int kTapLine[20] = {9, 9, 10, 11, 5, 6, 7, 5, 5, 6, 7, 9, 10, 11, 12, 14, 13, 15, 19, 17};
constexpr int kTapPosition[20] = {266, 2974, 1913, 1996, 1990, 187, 1066, 353,  3627, 1228,
                                  2673, 2111, 335,  121,  897,  359, 375,  729, 527,  698};

}  // namespace network
}  // namespace ulvetta
