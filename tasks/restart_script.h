#pragma once
// The script that runs an installer which may restart the host process, keeps its exit code and cleans the depot.

#include "util/string.h"

/// The text of the script for the depot directory (ending in "/"), the product code in lower case and the translator
/// command, which an installer that succeeded is followed by unless it is empty. It takes the installer's command line
/// as its arguments.
VMQ::String restartScript(const VMQ::String& depot, const VMQ::String& product, const VMQ::String& translatorCommand);
