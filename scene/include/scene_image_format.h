#pragma once

#include <cstdint>
#include <string_view>

namespace scene {

/// The image file formats that scenes refer to.
enum ImageFormat : std::uint32_t {
  imagePng = 0,
  imageBmp = 1,
  imageTga = 2,
  imageTiff = 3,
  imageJpeg = 4,
  imageExr = 5,
  imageHdr = 6,
  imagePfm = 7,
  imageWebp = 8,
  imageWebm = 9,
};

/// The format of a file extension (exact, case-sensitive: "tif", "jpg", ...); png for any
/// extension it does not know.
ImageFormat imageFormatFromExtension(std::string_view extension);
/// The format's name ("png", "tiff", ...); empty for a value that is no format.
std::string_view imageFormatExtension(std::uint32_t format);
/// The per-format flag of the format table (true for png, bmp, tga, tiff, exr, webp).
bool imageFormatFlag(std::uint32_t format);
/// The formats' names, `;`-separated: all of them, or all but webm when `flag` is set.
std::string_view imageFormatFilter(bool flag);

}  // namespace scene
