#include "util/parent_component.h"

namespace VMQ {

bool hasParentComponent(const String& path) {
  return (String("/") + path + String("/")).find(String("/../"), 0) != String::NPOS;
}

}  // namespace VMQ
