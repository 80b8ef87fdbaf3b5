#pragma once

#include "b_attrib_link.h"
#include "b_attribute_map.h"

#include <gtest/gtest.h>

#include <string>

namespace testing_support {

/// Moves member `name` of `map` into the map's member map "store" and leaves a link to it
/// in its place, so that the map holds the same value behind a link.
inline void moveBehindLink(base::AttribMap& map, base::name_id name) {
  const base::name_id store = base::intern("store");
  if (!map.findMember(store)) map.attribute(store, new base::AttribMap);
  (*map.findAttributeMutable(store))->asMap()->attribute(name, map.findMember(name)->clone());
  auto* link = new base::AttribLink;
  ASSERT_TRUE(link->fromString("store/" + std::string(base::text(name))));
  map.attribute(name, link);
}

}  // namespace testing_support
