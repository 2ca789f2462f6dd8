#pragma once
// Texts and numbers of failures, as child processes report them.

namespace VMQ {

/// "Error occurred: ERRNO:<n> <text>" for an errno value, or "Unknown Error occurred: ERRNO:<n> " when its text could
/// not be had. Returns a new text, which the caller frees with free(), or null without memory. For any thread.
char* getErrorMsg(int errnum);

}  // namespace VMQ
