#pragma once

#include "b_api.h"
#include "b_structured.h"

#include <memory>
#include <string_view>

namespace base {

/// Writes JSON text: numbers that read back to the same bits, strings escaped.
class BASE1_API JsonWriter : public StructuredWriter {
 public:
  JsonWriter();
  ~JsonWriter() override;

  /// The text written so far.
  std::string_view text() const;

  void beginObject() override;
  void key(std::string_view name) override;
  void endObject() override;
  void beginArray() override;
  void endArray() override;
  void null() override;
  void value(bool value) override;
  void value(std::int64_t value) override;
  void value(std::uint64_t value) override;
  void value(float value) override;
  void value(double value) override;
  void value(std::string_view text) override;

 private:
  struct Impl;
  std::unique_ptr<Impl> m_impl;
};

/// Reads JSON text. Nesting deeper than `deepest` levels is refused by beginObject and
/// beginArray, so that a hostile text cannot exhaust the stack of a recursive reader.
class BASE1_API JsonReader : public StructuredReader {
 public:
  static constexpr std::size_t deepest = 256;

  /// Parses `text`; a malformed text throws base::exception with the parser's message and
  /// the byte offset.
  explicit JsonReader(std::string_view text);
  ~JsonReader() override;

  bool beginObject(std::size_t& size) override;
  bool key(base::string& name) override;
  void endObject() override;
  bool beginArray(std::size_t& size) override;
  void endArray() override;
  bool null() override;
  bool value(bool& value) override;
  bool value(std::int64_t& value) override;
  bool value(std::uint64_t& value) override;
  bool value(double& value) override;
  bool value(base::string& text) override;
  void skip() override;
  bool nextHasKey(std::string_view name) const override;
  bool find(std::string_view name) override;

 private:
  struct Impl;
  std::unique_ptr<Impl> m_impl;
};

}  // namespace base
