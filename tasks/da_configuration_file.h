#pragma once
// The data agent's configuration file and the list of providers that it starts with.

#include "util/str_str_map.h"
#include "util/string.h"

/// The installation home + "/config/um" + ("_" + instance, when there is one) + ".config".
VMQ::String getDaConfigFileName(const VMQ::String& instance);

/// Puts the file's "key=value" lines into the map: trimmed, without empty lines and those that begin with the comment
/// character; a line counts when neither side of its first "=" is empty. A file that cannot be read adds nothing.
void populateHashMapFromFile(const VMQ::String& file, char commentCharacter, VMQ::StrStrMap& map);

/// Replaces the line of `instance` that lists the start-up providers: instance + "|DATAPROVIDER|" + parameters + "|".
/// Every other line, blank ones included, stays, and so does the file's mode. True on success. Kept on purpose: when
/// the new contents cannot be put in place they stay in the file's name + ".copy".
bool changeDaStartupParms(const VMQ::String& parameters, const VMQ::String& file, const VMQ::String& instance);
