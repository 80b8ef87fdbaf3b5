#include "b_dynlib.h"
#include "thrown.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using stream_tests::thrown;

TEST(DynLib, FindsAnExportedFunctionAndAnswersNullForAMissingOne) {
  base::ref<base::DynLib> library(new base::DynLib(DYNLIB_PROBE));
  auto* answer = reinterpret_cast<int (*)()>(library->loadSymbol("probeAnswer"));
  ASSERT_NE(answer, nullptr);
  EXPECT_EQ(answer(), 42);
  EXPECT_EQ(library->loadSymbol("noSuchSymbol"), nullptr);
  // A second handle on the same library is independent of the first.
  base::ref<base::DynLib> again(new base::DynLib(DYNLIB_PROBE));
  library = nullptr;
  EXPECT_NE(again->loadSymbol("probeAnswer"), nullptr);
}

TEST(DynLib, AMissingFileThrowsWithTheFileName) {
  const auto error = thrown<base::api_exception>([] { base::DynLib library("/no/such/dir/scene_none.so"); });
  ASSERT_TRUE(error);
  EXPECT_NE(std::string(error->what()).find("/no/such/dir/scene_none.so"), std::string::npos) << error->what();
  EXPECT_STREQ(error->function(), "base::DynLib::DynLib");
}

TEST(DynLib, AFileThatIsNoLibraryThrows) {
  const auto error = thrown<base::api_exception>([] { base::DynLib library(DYNLIB_NOT_A_LIBRARY); });
  ASSERT_TRUE(error);
  EXPECT_NE(std::string(error->what()).find(DYNLIB_NOT_A_LIBRARY), std::string::npos) << error->what();
}

}  // namespace
