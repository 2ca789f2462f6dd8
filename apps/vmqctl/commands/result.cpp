// Reads results out of rows and puts them into words.

#include "apps/vmqctl/commands/result.h"

#include "apps/vmqctl/failure.h"
#include "apps/vmqctl/messages.h"

namespace vmqctl {

std::string textIn(const Json& row, const char* column) {
  const auto value = row.find(column);
  return value != row.end() && value->is_string() ? value->get<std::string>() : "";
}

Result resultOf(const Json& row) {
  const auto value = row.find("RETVAL");
  if (value == row.end() || !value->is_number_integer()) {
    throw Failure(ExitCode::Failed, "The daemon's answer has no number in RETVAL, so the outcome is not known.",
                  "Check that vmqd and vmqctl are of the same version.");
  }
  return {value->get<long>(), textIn(row, "RETMSGID"), textIn(row, "RETMSGPARM")};
}

std::string messageText(const std::string& id) {
  const Message* message = findMessage(id);
  return message != nullptr ? std::string(message->text) : "";
}

std::string explanation(const Result& result) {
  std::string text;
  if (!result.messageId.empty()) {
    const std::string known = messageText(result.messageId);
    text = result.messageId + " " + (known.empty() ? "This message id is not in the catalogue." : known);
  } else if (result.returnValue != 0) {
    // Some failures carry no message; what their number stands for may fit only in part.
    const std::string usual = messageText(std::string(messageIdOf(result.returnValue)));
    text = "Return value " + std::to_string(result.returnValue) + " came without a message." +
           (usual.empty() ? "" : " It stands for: " + usual);
  }
  if (!result.parameters.empty()) text += (text.empty() ? "" : " ") + ("(parameters: " + result.parameters + ")");
  return text;
}

}  // namespace vmqctl
