#pragma once

#include "b_fs.h"

namespace base::fs {

/// The descriptor of the "gzip" file system: it opens `name.gz` for reading as the data that
/// the gzip file holds, reading the compressed file through a "system" file system of the
/// same factory.
ref<IPluginDesc> gzipFileSystem();

}  // namespace base::fs
