#include "b_type_traits.h"

#include <gtest/gtest.h>

namespace {

TEST(TypeTraits, ScalarNamesAndArrayNames) {
  EXPECT_EQ(base::text(base::TypeTraits<bool>::n_name), "bool");
  EXPECT_EQ(base::text(base::TypeTraits<signed char>::n_name), "int8");
  EXPECT_EQ(base::text(base::TypeTraits<unsigned char>::n_name), "uint8");
  EXPECT_EQ(base::text(base::TypeTraits<short>::n_name), "int16");
  EXPECT_EQ(base::text(base::TypeTraits<unsigned short>::n_name), "uint16");
  EXPECT_EQ(base::text(base::TypeTraits<int>::n_name), "int32");
  EXPECT_EQ(base::text(base::TypeTraits<unsigned>::n_name), "uint32");
  EXPECT_EQ(base::text(base::TypeTraits<std::int64_t>::n_name), "int64");
  EXPECT_EQ(base::text(base::TypeTraits<std::uint64_t>::n_name), "uint64");
  EXPECT_EQ(base::text(base::TypeTraits<float>::n_name), "float");
  EXPECT_EQ(base::text(base::TypeTraits<double>::n_name), "double");
  EXPECT_EQ(base::text(base::TypeTraits<base::string>::n_name), "string");
  EXPECT_EQ(base::text(base::TypeTraits<float>::n_array_name), "float[]");
  EXPECT_EQ(base::TypeTraits<unsigned>::n_array_name, base::intern("uint32[]"));
}

}  // namespace
