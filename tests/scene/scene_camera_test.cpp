#include "scene_camera.h"
#include "b_exception.h"
#include "scene_image_format.h"

#include <gtest/gtest.h>

#include <cmath>

namespace {

TEST(FieldOfView, AlongEachFit) {
  const base::base_vec2<float> fullFrame{36.0f, 24.0f};
  EXPECT_NEAR(scene::getFieldOfView(fullFrame, 50.0f, scene::fitHorizontal, 1.5f), 0.6911f, 5e-5f);
  EXPECT_NEAR(scene::getFieldOfView(fullFrame, 50.0f, scene::fitDiagonal, 1.5f), 0.8167f, 5e-5f);
  EXPECT_NEAR(scene::getFieldOfView(fullFrame, 50.0f, scene::fitVertical, 1.5f), 0.4711f, 5e-5f);
  // Automatic: the height for a landscape image, the width for a portrait one.
  EXPECT_EQ(scene::getFieldOfView(fullFrame, 50.0f, scene::fitAuto, 1.0f),
            scene::getFieldOfView(fullFrame, 50.0f, scene::fitVertical, 1.0f));
  EXPECT_EQ(scene::getFieldOfView(fullFrame, 50.0f, scene::fitAuto, 0.5f),
            scene::getFieldOfView(fullFrame, 50.0f, scene::fitHorizontal, 0.5f));
  EXPECT_THROW(scene::getFieldOfView(fullFrame, 50.0f, 4, 1.0f), base::switch_exception);
}

TEST(FieldOfView, VerticalAngleOfAFittedOne) {
  const float fov = 0.8f;
  EXPECT_EQ(scene::sensorFitVertical(fov, scene::fitVertical, 2.0f), fov);
  EXPECT_EQ(scene::sensorFitVertical(fov, scene::fitAuto, 2.0f), fov);
  const float fromHorizontal = 2.0f * std::atan(std::tan(fov / 2.0f) / 2.0f);
  EXPECT_FLOAT_EQ(scene::sensorFitVertical(fov, scene::fitHorizontal, 2.0f), fromHorizontal);
  EXPECT_FLOAT_EQ(scene::sensorFitVertical(fov, scene::fitAuto, 0.5f), 2.0f * std::atan(std::tan(fov / 2.0f) / 0.5f));
  EXPECT_FLOAT_EQ(scene::sensorFitVertical(fov, scene::fitDiagonal, 2.0f),
                  2.0f * std::atan(std::tan(fov / 2.0f) / std::sqrt(5.0f)));
  EXPECT_EQ(scene::sensorFitVertical(fov, 9, 2.0f), 0.0f);
}

TEST(ImageFormats, ExtensionsNamesAndFilters) {
  EXPECT_EQ(scene::imageFormatFromExtension("tif"), scene::imageTiff);
  EXPECT_EQ(scene::imageFormatFromExtension("tx"), scene::imageTiff);
  EXPECT_EQ(scene::imageFormatFromExtension("jpe"), scene::imageJpeg);
  EXPECT_EQ(scene::imageFormatFromExtension("webm"), scene::imageWebm);
  EXPECT_EQ(scene::imageFormatFromExtension("JPG"), scene::imagePng);  // exact comparison
  EXPECT_EQ(scene::imageFormatFromExtension("gif"), scene::imagePng);
  EXPECT_EQ(scene::imageFormatExtension(scene::imageJpeg), "jpeg");
  EXPECT_EQ(scene::imageFormatExtension(10), "");
  EXPECT_TRUE(scene::imageFormatFlag(scene::imageWebp));
  EXPECT_FALSE(scene::imageFormatFlag(scene::imageHdr));
  EXPECT_FALSE(scene::imageFormatFlag(10));
  EXPECT_EQ(scene::imageFormatFilter(true), "png;bmp;tga;tiff;jpeg;exr;hdr;pfm;webp");
  EXPECT_EQ(scene::imageFormatFilter(false), "png;bmp;tga;tiff;jpeg;exr;hdr;pfm;webp;webm");
}

}  // namespace
