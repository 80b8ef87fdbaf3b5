#pragma once

#include "b_vec.h"

#include <cstdint>

namespace scene {

/// How a camera's sensor fits the image: the dimension a field of view is measured along.
enum SensorFit : std::uint8_t {
  fitAuto = 0,  ///< the height for a landscape image (aspect >= 1), else the width
  fitHorizontal = 1,
  fitVertical = 2,
  fitDiagonal = 3,
};

/// The field of view in radians of a lens of `focalLength` over a sensor of (width, height)
/// in the same units, along the dimension `sensorFit` chooses for an image of `aspect`
/// (width / height). Another fit value throws base::switch_exception.
float getFieldOfView(const base::base_vec2<float>& sensor, float focalLength, std::uint8_t sensorFit, float aspect);

/// The vertical angle of a field of view measured along the fitted dimension; 0 for a fit
/// value that is none of the four.
float sensorFitVertical(float fieldOfView, std::uint8_t sensorFit, float aspect);

}  // namespace scene
