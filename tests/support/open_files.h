#pragma once
// What this process has open, by its name.

#include <string>
#include <vector>

/// The descriptors under which this process has the file open.
std::vector<int> descriptorsOf(const std::string& path);

/// True when programs that this process starts do not get the descriptor.
bool isClosedOnExec(int descriptor);
