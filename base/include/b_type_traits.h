#pragma once

#include "b_containers.h"
#include "b_name.h"

#include <cstdint>

namespace base {

/// `n_name` and `n_array_name` name a value type and an array of it. Attribute type checks
/// compare these handles. Types get their specialisation with their class.
template <class T>
struct TypeTraits;

#define BASE_TYPE_NAMES(Type, Name)                               \
  template <>                                                     \
  struct TypeTraits<Type> {                                       \
    static inline const name_id n_name = intern(Name);            \
    static inline const name_id n_array_name = intern(Name "[]"); \
  }

BASE_TYPE_NAMES(bool, "bool");
BASE_TYPE_NAMES(signed char, "int8");
BASE_TYPE_NAMES(unsigned char, "uint8");
BASE_TYPE_NAMES(short, "int16");
BASE_TYPE_NAMES(unsigned short, "uint16");
BASE_TYPE_NAMES(int, "int32");
BASE_TYPE_NAMES(unsigned int, "uint32");
BASE_TYPE_NAMES(std::int64_t, "int64");
BASE_TYPE_NAMES(std::uint64_t, "uint64");
BASE_TYPE_NAMES(float, "float");
BASE_TYPE_NAMES(double, "double");
BASE_TYPE_NAMES(base::string, "string");

/// A list of T goes by T's array name ("float[]"), so that maps reach lists as
/// `attribute<base::vector<float>>`.
template <class T>
struct TypeTraits<base::vector<T>> {
  static inline const name_id n_name = TypeTraits<T>::n_array_name;
};

}  // namespace base
