#pragma once

namespace scenetool {

/// Loads the attribute description set from data/attributes beside the program's folder
/// (<bin>/../data/attributes); warns when there is none.
void loadDescriptions();

}  // namespace scenetool
