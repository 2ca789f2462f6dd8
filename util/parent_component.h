#pragma once
// Names that would leave the directory they are put under.

#include "util/string.h"

namespace VMQ {

/// True when a component of the path is "..".
bool hasParentComponent(const String& path);

}  // namespace VMQ
