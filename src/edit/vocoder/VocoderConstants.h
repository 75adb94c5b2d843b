#pragma once

namespace glimmet {

// The vocoder's angles are computed in double whatever the data's type.
constexpr double kVocoderPi = 3.14159265358979323846;
constexpr double kVocoderTwoPi = 2.0 * kVocoderPi;

}  // namespace glimmet
