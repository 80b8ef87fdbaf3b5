#include "ply_bench_files.h"

#include <fmt/format.h>

#include <array>
#include <bit>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <string>

namespace bench {
namespace {

constexpr int meshVertices = 1'000'000;
constexpr int meshTriangles = 2'000'000;
constexpr int cloudPoints = 2'000'000;
constexpr int splatPoints = 1'000'000;
constexpr int splatFields = 62;

using File = std::unique_ptr<std::FILE, int (*)(std::FILE*)>;

std::array<std::uint32_t, 3> meshFace(int f) {
  const auto first = static_cast<std::uint32_t>(f / 2);
  return {first, (first + 1) % meshVertices, (first + 2) % meshVertices};
}

const char* formatWord(Encoding encoding) {
  switch (encoding) {
    case Encoding::ascii:
      return "ascii";
    case Encoding::little:
      return "binary_little_endian";
    case Encoding::big:
      return "binary_big_endian";
  }
  return "";
}

// Writes values in the file's encoding.
class Writer {
 public:
  Writer(std::FILE* file, Encoding encoding) : m_file(file), m_encoding(encoding) {}

  void real(float value) {
    // Nine significant digits, as other tools write floats.
    if (m_encoding == Encoding::ascii) return text(fmt::format("{:.9g}", value));
    raw(std::bit_cast<std::uint32_t>(value), 4);
  }
  void integer(std::uint32_t value, int bytes, bool isSigned = false) {
    if (m_encoding == Encoding::ascii) {
      return text(isSigned ? fmt::format("{}", static_cast<std::int32_t>(value)) : fmt::format("{}", value));
    }
    raw(value, bytes);
  }
  void endLine() {
    if (m_encoding == Encoding::ascii) {
      m_line.back() = '\n';
      std::fwrite(m_line.data(), 1, m_line.size(), m_file);
      m_line.clear();
    }
  }

 private:
  void text(const std::string& word) {
    m_line += word;
    m_line += ' ';
  }
  void raw(std::uint32_t value, int bytes) {
    char out[4];
    for (int i = 0; i < bytes; ++i) {
      const int shift = m_encoding == Encoding::little ? 8 * i : 8 * (bytes - 1 - i);
      out[i] = static_cast<char>(value >> shift);
    }
    std::fwrite(out, 1, static_cast<std::size_t>(bytes), m_file);
  }

  std::FILE* m_file;
  Encoding m_encoding;
  std::string m_line;
};

void writeCloud(std::FILE* file, Encoding encoding);

// The mesh; with `texcoords` its faces carry a texcoord list of six floats as well.
void writeMesh(std::FILE* file, Encoding encoding, bool texcoords) {
  fmt::print(file,
             "ply\nformat {} 1.0\ncomment benchmark mesh\nelement vertex {}\nproperty float x\nproperty float y\n"
             "property float z\nproperty float nx\nproperty float ny\nproperty float nz\nproperty uchar red\n"
             "property uchar green\nproperty uchar blue\nproperty uchar alpha\nproperty float u\nproperty float v\n"
             "element face {}\nproperty list uchar int vertex_indices\n{}end_header\n",
             formatWord(encoding), meshVertices, meshTriangles,
             texcoords ? "property list uchar float texcoord\n" : "");
  Writer out(file, encoding);
  for (int i = 0; i < meshVertices; ++i) {
    const float t = static_cast<float>(i) * 0.001f;
    for (float value : {t, t * 0.5f - 3.25f, 1.0f / (1.0f + t), 0.267f, -0.534f, 0.802f}) out.real(value);
    for (std::uint32_t channel : {i % 256u, (i * 7) % 256u, (i * 13) % 256u, 255u}) out.integer(channel, 1);
    out.real(static_cast<float>(i % 1000) / 1000.0f);
    out.real(static_cast<float>(i % 777) / 777.0f);
    out.endLine();
  }
  for (int f = 0; f < meshTriangles; ++f) {
    out.integer(3, 1);
    for (std::uint32_t index : meshFace(f)) out.integer(index, 4, true);
    if (texcoords) {
      out.integer(6, 1);
      for (int k = 0; k < 6; ++k) out.real(static_cast<float>((f + k) % 1024) / 1024.0f);
    }
    out.endLine();
  }
}

// A Gaussian-splat cloud: positions, normals, 48 colour coefficients, opacity, scale and
// rotation, 62 floats a point.
void writeSplat(std::FILE* file, Encoding encoding) {
  std::string header = fmt::format("ply\nformat {} 1.0\nelement vertex {}\n", formatWord(encoding), splatPoints);
  for (const char* name : {"x", "y", "z", "nx", "ny", "nz"}) header += fmt::format("property float {}\n", name);
  for (int k = 0; k < 3; ++k) header += fmt::format("property float f_dc_{}\n", k);
  for (int k = 0; k < 45; ++k) header += fmt::format("property float f_rest_{}\n", k);
  header += "property float opacity\n";
  for (int k = 0; k < 3; ++k) header += fmt::format("property float scale_{}\n", k);
  for (int k = 0; k < 4; ++k) header += fmt::format("property float rot_{}\n", k);
  std::fputs((header + "end_header\n").c_str(), file);
  Writer out(file, encoding);
  for (int i = 0; i < splatPoints; ++i) {
    for (int k = 0; k < splatFields; ++k) out.real(static_cast<float>((i * 31 + k * 7) % 4096) / 512.0f - 4.0f);
    out.endLine();
  }
}

const char* shapeName(Shape shape) {
  switch (shape) {
    case Shape::mesh:
      return "mesh";
    case Shape::cloud:
      return "cloud";
    case Shape::texcoordMesh:
      return "texcoord_mesh";
    case Shape::splat:
      return "splat";
  }
  return "";
}

void writeShape(std::FILE* file, Shape shape, Encoding encoding) {
  switch (shape) {
    case Shape::mesh:
    case Shape::texcoordMesh:
      return writeMesh(file, encoding, shape == Shape::texcoordMesh);
    case Shape::cloud:
      return writeCloud(file, encoding);
    case Shape::splat:
      return writeSplat(file, encoding);
  }
}

void writeCloud(std::FILE* file, Encoding encoding) {
  fmt::print(file,
             "ply\nformat {} 1.0\nelement vertex {}\nproperty float x\nproperty float y\nproperty float z\n"
             "property uchar red\nproperty uchar green\nproperty uchar blue\nend_header\n",
             formatWord(encoding), cloudPoints);
  Writer out(file, encoding);
  for (int i = 0; i < cloudPoints; ++i) {
    const float t = static_cast<float>(i);
    for (float value : {t * 0.013f, t * -0.0071f + 12.5f, 100.0f / (t + 1.0f)}) out.real(value);
    for (std::uint32_t channel : {i % 256u, (i / 256) % 256u, 128u}) out.integer(channel, 1);
    out.endLine();
  }
}

}  // namespace

std::string plyFile(Shape shape, Encoding encoding) {
  const std::filesystem::path folder = std::filesystem::temp_directory_path() / "meshport-bench";
  std::filesystem::create_directories(folder);
  const std::string name = fmt::format("{}_{}_9g.ply", shapeName(shape), formatWord(encoding));
  const std::filesystem::path path = folder / name;
  if (std::filesystem::exists(path)) return path.string();
  const std::filesystem::path partial = folder / (name + ".partial");
  {
    File file(std::fopen(partial.string().c_str(), "wb"), &std::fclose);
    if (!file) throw std::runtime_error("cannot write " + partial.string());
    writeShape(file.get(), shape, encoding);
  }
  // Renamed only when complete, so an interrupted run never leaves a short file behind.
  std::filesystem::rename(partial, path);
  return path.string();
}

base::vector<std::uint32_t> meshIndices() {
  base::vector<std::uint32_t> indices;
  indices.reserve(std::size_t(meshTriangles) * 3);
  for (int f = 0; f < meshTriangles; ++f) {
    for (std::uint32_t index : meshFace(f)) indices.push_back(index);
  }
  return indices;
}

scene::SceneFactory& plugins() {
  static scene::SceneFactory factory;
  static const bool loaded = [] {
    factory.reloadPlugins();
    return true;
  }();
  static_cast<void>(loaded);
  return factory;
}

}  // namespace bench
