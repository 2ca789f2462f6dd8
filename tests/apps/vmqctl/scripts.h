#pragma once
// What scripted daemons say, in the words of the interface.

#include <memory>
#include <string>

#include "tests/apps/vmqctl/scripted_daemon.h"

inline const std::string eventsRequest = "GET /v1/tables/KAGDYST/events";
inline const std::string commandRequest = "POST /v1/tables/KAGREQT/query";

/// A status event's row.
inline std::string statusRow(const std::string& transid, const std::string& command, int retval = 0,
                             const std::string& messageId = "", const std::string& parameters = "",
                             const std::string& target = "") {
  return R"({"ORIGINNODE":"node1","TRANSID":")" + transid + R"(","COMMAND":")" + command + R"(","RETVAL":)" +
         std::to_string(retval) + R"(,"RETMSGID":")" + messageId + R"(","RETMSGPARM":")" + parameters +
         R"(","TARGETMSN":")" + target + R"("})";
}

/// The answer to a request: one row, with the columns that matter here.
inline std::string answer(int retval = 0, const std::string& messageId = "", const std::string& parameters = "") {
  return R"({"table":"KAGREQT","rows":[{"ORIGINNODE":"node1","RETVAL":)" + std::to_string(retval) + R"(,"RETMSGID":")" +
         messageId + R"(","RETMSGPARM":")" + parameters + R"("}]})";
}

inline std::string refusal(const std::string& code, const std::string& message) {
  return R"({"error":{"code":")" + code + R"(","message":")" + message + R"("}})";
}

/// Accepts every request and ends it with this status event, once the request is there.
inline void endRequestsWith(ScriptedDaemon& daemon, const std::string& row) {
  const auto asked = std::make_shared<Gate>();  // the daemon's threads may outlive the test's own steps
  daemon.on(eventsRequest, [asked, row](Exchange& exchange) {
    exchange.openStream();
    if (!asked->wait()) return;
    exchange.event("row", row);
    exchange.awaitClose();
  });
  daemon.on(commandRequest, [asked](Exchange& exchange) {
    exchange.reply(200, answer());
    asked->open();
  });
}
