// ASCII numbers: the fast path for common forms must give exactly what std::from_chars gives
// for the type itself, on the boundaries where a shortcut would round wrongly and on many
// random numbers.

#include "ply_text.h"
#include "ply_real_scan.h"

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <bit>
#include <charconv>
#include <cstdint>
#include <limits>
#include <random>
#include <string>

namespace {

// What from_chars gives for the type itself; out of its range, the nearest: infinity or 0.
template <class T>
T exact(const std::string& word) {
  T value = 0;
  const bool negative = word.front() == '-';
  const char* first = word.data() + (negative || word.front() == '+');
  if (std::from_chars(first, word.data() + word.size(), value).ec == std::errc::result_out_of_range) {
    long double wide = 0;
    std::from_chars(first, word.data() + word.size(), wide);
    value = wide > 1 ? std::numeric_limits<T>::infinity() : T(0);
  }
  return negative ? -value : value;
}

template <ply::DataType Type>
void expectExact(const std::string& word) {
  using T = ply::detail::Held<Type>;
  EXPECT_EQ(std::bit_cast<ply::detail::UnsignedOfSize<sizeof(T)>>(ply::parseAsciiHeld<Type>(word)),
            std::bit_cast<ply::detail::UnsignedOfSize<sizeof(T)>>(exact<T>(word)))
      << word;
}

void expectBothExact(const std::string& word) {
  expectExact<ply::DataType::float32>(word);
  expectExact<ply::DataType::float64>(word);
}

TEST(PlyAsciiNumbers, BoundariesOfTheFastPath) {
  for (const char* word : {
           "16777217",                    // halfway between two floats: a tie, rounded to even
           "16777219",                    // halfway again, the other way
           "0.000000059604644775390625",  // 2^-24, exact
           "1.00000005960464477539",      // just above a float tie once rounded to double
           "9007199254740993",            // 2^53 + 1: the mantissa no longer fits a double
           "9007199254740992",            // 2^53 itself
           "1e22",
           "1e23",
           "1e-22",
           "1e-23",
           "4.9406564584124654e-324",
           "3.4028235e38",
           "3.4028236e38",
           "-0",
           "+0.0",
           "0e5",
           "123456789",
           "0.123456789",
           "-1.5e+02",
           ".5",
           "5.",
           "1E-5",
       }) {
    expectBothExact(word);
  }
}

// A fraction of zeros keeps the mantissa at 0, so only the digit counter bounds it. With a
// counter of 8 bits, 127 digits are the most that are counted; a longer fraction goes to the
// exact reader rather than wrapping the count (0.<260 zeros>1 read as 1e-5).
TEST(PlyAsciiNumbers, AFractionOfAnyLengthIsCountedWithoutOverflow) {
  const auto scan = [](const std::string& word, double& value) {
    return ply::detail::scanRealFast(word.data(), word.data() + word.size(), value);
  };
  // The fraction's length and the written exponent together make the power of ten.
  double value = 0;
  const std::string shifted = "0." + std::string(126, '0') + "1e120";
  EXPECT_EQ(scan(shifted, value), shifted.data() + shifted.size());
  EXPECT_EQ(value, 1e-7);
  // A fraction of a million digits leaves the fast reading and reads exactly.
  const std::string word = "0." + std::string(1 << 20, '0') + "1";
  EXPECT_EQ(scan(word, value), nullptr);
  expectBothExact(word);
  expectBothExact("-0." + std::string(1 << 20, '0'));
}

TEST(PlyAsciiNumbers, RandomDecimalsMatchFromChars) {
  std::mt19937_64 random(20261206);
  std::uniform_int_distribution<int> digits(1, 19);
  std::uniform_int_distribution<int> exponent(-30, 30);
  std::uniform_int_distribution<int> digit(0, 9);
  for (int n = 0; n < 200000; ++n) {
    std::string mantissa;
    for (int k = digits(random); k > 0; --k) mantissa += static_cast<char>('0' + digit(random));
    const int point = std::uniform_int_distribution<int>(0, static_cast<int>(mantissa.size()))(random);
    std::string word = n % 3 == 0 ? "-" : "";
    word += mantissa.substr(0, point);
    word += '.';
    word += mantissa.substr(point);
    if (n % 2) word += fmt::format("e{}", exponent(random));
    expectBothExact(word);
  }
}

}  // namespace
