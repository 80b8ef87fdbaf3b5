#include "b_components.h"
#include "b_box.h"
#include "b_color.h"
#include "b_matrix.h"
#include "b_normal.h"
#include "b_quat.h"
#include "b_timecode.h"
#include "b_vec.h"

#include <gtest/gtest.h>

#include <set>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

namespace {

using base::base_box;
using base::base_vec2;
using base::base_vec3;
using mat43f = base::base_mat43<float, double, base::base_mat33<float>>;

// Attributes copy these values as raw bytes and build them as aggregates; a constructor or
// a virtual function added to one of them would break that silently.
template <class... T>
constexpr bool allPlainValues = ((std::is_trivially_copyable_v<T> && std::is_aggregate_v<T>)&&...);
static_assert(allPlainValues<base_vec2<float>, base_vec3<double>, base::base_vec4<int>, base::base_quat<float>,
                             base::base_mat22<double>, base::base_mat33<float>, mat43f, base_box<base_vec3<float>>,
                             base::base_color4<float>, base::normal, base::TimeCode>);

TEST(Components, Mat43VisitsRotationRowByRowThenTranslationEachWithItsOwnType) {
  mat43f value{};
  float next = 1;
  for (auto& row : value.rotation.m) {
    for (float& element : row) element = next++;
  }
  value.translation = {10.5, 11.5, 12.5};
  static_assert(base::componentCount<mat43f> == 12);
  static_assert(std::is_same_v<base::component_t<mat43f, 8>, float>);
  static_assert(std::is_same_v<base::component_t<mat43f, 9>, double>);

  std::vector<std::pair<bool, double>> seen;  // (is a float, value)
  const mat43f& constant = value;
  base::forEachComponent(constant, [&seen](const auto& each) {
    static_assert(std::is_const_v<std::remove_reference_t<decltype(each)>>);
    seen.emplace_back(std::is_same_v<std::decay_t<decltype(each)>, float>, each);
  });
  ASSERT_EQ(seen.size(), 12u);
  EXPECT_EQ(seen[1], std::pair(true, 2.0));  // m[0][1]: row-major
  EXPECT_EQ(seen[3], std::pair(true, 4.0));  // m[1][0]
  EXPECT_EQ(seen[8], std::pair(true, 9.0));
  EXPECT_EQ(seen[9], std::pair(false, 10.5));

  // The non-const form writes through to the value.
  base::forEachComponent(value, [](auto& each) { each = each * 2; });
  EXPECT_EQ(value.rotation.m[2][1], 16.0f);
  EXPECT_EQ(value.translation.z, 25.0);
  base::component<11>(value) = -1;
  EXPECT_EQ(value.translation.z, -1.0);
}

TEST(Components, BoxIsMinThenMaxAndScalarsAreOneComponent) {
  const base_box<base_vec2<int>> box{{1, 2}, {3, 4}};
  std::vector<int> seen;
  base::forEachComponent(box, [&seen](int each) { seen.push_back(each); });
  EXPECT_EQ(seen, (std::vector<int>{1, 2, 3, 4}));

  double scalar = 2;
  static_assert(base::componentCount<double> == 1 && base::componentCount<base::TimeCode> == 1);
  base::forEachComponent(scalar, [](double& each) { each += 1; });
  EXPECT_EQ(scalar, 3.0);
}

TEST(Components, PairwiseVisitMatchesComponentsInOrder) {
  const base::base_quat<float> a{1, 2, 3, 4};
  base::base_quat<float> b{};
  base::forEachComponent(b, a, [](float& target, const float& source) { target = source * 10; });
  EXPECT_EQ(b, (base::base_quat<float>{10, 20, 30, 40}));
}

// Attribute type checks compare these handles: two types sharing a name would pass for
// one another.
TEST(TypeNames, EveryValueTypeHasItsOwnNameAndAnArrayName) {
  std::set<std::string> names;
  auto add = [&names]<class T>(T*) {
    const std::string name(base::text(base::TypeTraits<T>::n_name));
    EXPECT_EQ(std::string(base::text(base::TypeTraits<T>::n_array_name)), name + "[]");
    EXPECT_TRUE(names.insert(name).second) << name;
  };
  auto addVectors = [&add]<class T>(T* tag) {
    add(static_cast<base_vec2<T>*>(nullptr));
    add(static_cast<base_vec3<T>*>(nullptr));
    add(static_cast<base::base_vec4<T>*>(nullptr));
    if constexpr (std::is_same_v<T, int> || std::is_same_v<T, unsigned> || std::is_floating_point_v<T>) {
      add(static_cast<base_box<base_vec2<T>>*>(nullptr));
      add(static_cast<base_box<base_vec3<T>>*>(nullptr));
    }
    (void)tag;
  };
  addVectors(static_cast<signed char*>(nullptr));
  addVectors(static_cast<unsigned char*>(nullptr));
  addVectors(static_cast<short*>(nullptr));
  addVectors(static_cast<unsigned short*>(nullptr));
  addVectors(static_cast<int*>(nullptr));
  addVectors(static_cast<unsigned*>(nullptr));
  addVectors(static_cast<float*>(nullptr));
  addVectors(static_cast<double*>(nullptr));
  add(static_cast<base::base_quat<float>*>(nullptr));
  add(static_cast<base::base_quat<double>*>(nullptr));
  add(static_cast<base::base_mat22<float>*>(nullptr));
  add(static_cast<base::base_mat22<double>*>(nullptr));
  add(static_cast<base::base_mat33<float>*>(nullptr));
  add(static_cast<mat43f*>(nullptr));
  add(static_cast<base::base_color4<float>*>(nullptr));
  add(static_cast<base::normal*>(nullptr));
  add(static_cast<base::TimeCode*>(nullptr));
  EXPECT_EQ(names.size(), 24u + 8u + 9u);

  // The suffixes that are easy to swap.
  EXPECT_EQ(base::text(base::TypeTraits<base_vec2<unsigned char>>::n_name), "vec2ub");
  EXPECT_EQ(base::text(base::TypeTraits<base_vec3<signed char>>::n_name), "vec3b");
  EXPECT_EQ(base::text(base::TypeTraits<base_box<base_vec3<unsigned>>>::n_name), "box3u");
}

}  // namespace
