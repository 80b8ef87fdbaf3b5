#include "scene_camera.h"

#include "b_exception.h"

#include <cmath>

namespace scene {

float getFieldOfView(const base::base_vec2<float>& sensor, float focalLength, std::uint8_t sensorFit, float aspect) {
  float size = 0;
  switch (sensorFit) {
    case fitAuto:
      size = aspect >= 1.0f ? sensor.y : sensor.x;
      break;
    case fitHorizontal:
      size = sensor.x;
      break;
    case fitVertical:
      size = sensor.y;
      break;
    case fitDiagonal:
      size = std::sqrt(sensor.x * sensor.x + sensor.y * sensor.y);
      break;
    default:
      base::raise<base::switch_exception>("scene::getFieldOfView");
  }
  return 2.0f * std::atan(size * 0.5f / focalLength);
}

float sensorFitVertical(float fieldOfView, std::uint8_t sensorFit, float aspect) {
  const float halfTangent = std::tan(fieldOfView / 2.0f);
  switch (sensorFit) {
    case fitAuto:
      return aspect >= 1.0f ? fieldOfView : 2.0f * std::atan(halfTangent / aspect);
    case fitHorizontal:
      return 2.0f * std::atan(halfTangent / aspect);
    case fitVertical:
      return fieldOfView;
    case fitDiagonal:
      return 2.0f * std::atan(halfTangent / std::sqrt(1.0f + aspect * aspect));
    default:
      return 0.0f;
  }
}

}  // namespace scene
