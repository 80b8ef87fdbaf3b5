#include "scene_image_format.h"

#include <algorithm>
#include <array>
#include <initializer_list>

namespace scene {
namespace {

struct FormatEntry {
  std::string_view name;
  std::initializer_list<std::string_view> extensions;
  bool flag;
};

const std::array<FormatEntry, 10> formats{{
    {"png", {"png"}, true},
    {"bmp", {"bmp"}, true},
    {"tga", {"tga"}, true},
    {"tiff", {"tiff", "tif", "tx"}, true},
    {"jpeg", {"jpeg", "jpg", "jpe"}, false},
    {"exr", {"exr"}, true},
    {"hdr", {"hdr"}, false},
    {"pfm", {"pfm"}, false},
    {"webp", {"webp"}, true},
    {"webm", {"webm"}, false},
}};

}  // namespace

ImageFormat imageFormatFromExtension(std::string_view extension) {
  for (std::uint32_t format = 0; format < formats.size(); ++format) {
    const auto& accepted = formats[format].extensions;
    if (std::find(accepted.begin(), accepted.end(), extension) != accepted.end()) return ImageFormat(format);
  }
  return imagePng;
}

std::string_view imageFormatExtension(std::uint32_t format) {
  return format < formats.size() ? formats[format].name : std::string_view();
}

bool imageFormatFlag(std::uint32_t format) { return format < formats.size() && formats[format].flag; }

std::string_view imageFormatFilter(bool flag) {
  return flag ? "png;bmp;tga;tiff;jpeg;exr;hdr;pfm;webp" : "png;bmp;tga;tiff;jpeg;exr;hdr;pfm;webp;webm";
}

}  // namespace scene
