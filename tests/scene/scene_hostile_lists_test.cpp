// Every damaged or hostile object list under tests/data/scene/invalid is refused with a
// base::exception or an error in the log, read from a file into a factory that knows the
// scene types: never a crash, and never an allocation that the file cannot back.

#include "b_exception.h"
#include "b_fs.h"
#include "b_plugin_factory.h"
#include "log_capture.h"
#include "scene_schema_registry.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>

namespace {

std::vector<std::string> hostileLists() {
  std::vector<std::string> paths;
  for (const auto& entry :
       std::filesystem::directory_iterator(std::filesystem::path(MESHPORT_TEST_DATA) / "scene/invalid")) {
    if (entry.path().extension() == ".scene") paths.push_back(entry.path().string());
  }
  std::sort(paths.begin(), paths.end());
  return paths;
}

class HostileList : public ::testing::TestWithParam<std::string> {};

TEST_P(HostileList, IsRefused) {
  testing_support::LogCapture log(base::logError);
  base::ref<base::PluginFactory> factory(new base::PluginFactory("scene"));
  scene::register_scene_schema(*factory);
  bool refused = false;
  try {
    base::Stream stream = base::fs::master().open(GetParam(), base::fs::openForReading);
    factory->read(stream);
  } catch (const base::exception& error) {
    refused = !std::string_view(error.what()).empty();
  }
  EXPECT_TRUE(refused || !log.entries.empty());
}

INSTANTIATE_TEST_SUITE_P(Files, HostileList, ::testing::ValuesIn(hostileLists()),
                         [](const ::testing::TestParamInfo<std::string>& info) {
                           return std::filesystem::path(info.param).stem().string();
                         });

}  // namespace
