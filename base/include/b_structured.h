#pragma once

// The structured (text) form of attributes: a writer and a reader of nested objects, arrays
// and plain values. base::JsonWriter and base::JsonReader (b_json.h) are the JSON ones.

#include "b_api.h"
#include "b_containers.h"

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace base {

/// Takes values in order: inside an object, a key before each value.
class BASE1_API StructuredWriter {
 public:
  virtual ~StructuredWriter();
  virtual void beginObject() = 0;
  virtual void key(std::string_view name) = 0;
  virtual void endObject() = 0;
  virtual void beginArray() = 0;
  virtual void endArray() = 0;
  virtual void null() = 0;
  virtual void value(bool value) = 0;
  virtual void value(std::int64_t value) = 0;
  virtual void value(std::uint64_t value) = 0;
  /// Written so that reading gives back the same bits; NaN and the infinities as the texts
  /// "NaN", "Infinity" and "-Infinity".
  virtual void value(float value) = 0;
  virtual void value(double value) = 0;
  virtual void value(std::string_view text) = 0;
};

/// Gives values back in the order a writer took them. Every operation answers false, and
/// leaves its output unchanged, when the next value is not of the kind asked for.
class BASE1_API StructuredReader {
 public:
  virtual ~StructuredReader();
  /// Enters an object; `size` receives its member count.
  virtual bool beginObject(std::size_t& size) = 0;
  /// The next member's key inside the entered object; false after the last.
  virtual bool key(base::string& name) = 0;
  virtual void endObject() = 0;
  /// Enters an array; `size` receives its element count.
  virtual bool beginArray(std::size_t& size) = 0;
  virtual void endArray() = 0;
  /// Whether the next value is null; it is consumed when it is.
  virtual bool null() = 0;
  virtual bool value(bool& value) = 0;
  virtual bool value(std::int64_t& value) = 0;
  virtual bool value(std::uint64_t& value) = 0;
  /// Numbers, and the texts "NaN", "Infinity" and "-Infinity".
  virtual bool value(double& value) = 0;
  virtual bool value(base::string& text) = 0;
  /// Passes over the next value, whatever it is.
  virtual void skip() = 0;
  /// Whether the next value is an object with a member `name`; nothing is consumed.
  virtual bool nextHasKey(std::string_view name) const = 0;
  /// Inside the entered object, moves to member `name` (its value is read next); false when
  /// there is none.
  virtual bool find(std::string_view name) = 0;
};

}  // namespace base
