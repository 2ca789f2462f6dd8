#pragma once
// The catalogue of the message ids with which the component reports failures. docs/messages.md shows it to people.

#include <array>
#include <string>
#include <string_view>

namespace vmqctl {

struct Message {
  std::string_view id;          ///< "VMQ1001E"
  std::string_view text;        ///< one sentence: what happened and what to look at
  std::string_view parameters;  ///< what RETMSGPARM holds, joined by ","; empty when it holds nothing
};

/// In order of their numbers, 1001 to 1035, without gaps.
extern const std::array<Message, 35> messages;

/// The message with this id; null when there is none.
const Message* findMessage(std::string_view id);

/// The id that belongs to a return value; "" when there is none.
std::string_view messageIdOf(long returnValue);

}  // namespace vmqctl
