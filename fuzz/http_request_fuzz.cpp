// Requests to the daemon behind its HTTP library: a method, a path, the arguments of a query string, a body. The depot
// holds one file, and nothing outside of it may be reached.

#include <cstring>
#include <nlohmann/json.hpp>
#include <string>

#include "apps/vmqd/routes.h"
#include "fuzz/support.h"
#include "tests/host/sample_table.h"
#include "tests/support/temporary_directory.h"

namespace {

constexpr const char* methods[] = {"GET", "POST", "PUT", "HEAD"};
constexpr const char* paths[] = {"", "/v1/tables/SAMPLE1/query", "/v1/tables/SAMPLE1/events", "/v1/depot/", "/v1/rpc/"};

/// A home with a file in its depot and one beside it.
struct Home {
  Home() {
    folder.writeFile("depot/ux/file", "inside");
    folder.writeFile("secret", "outside!");
  }
  TemporaryDirectory folder;
};

vmqd::Service& service() {
  static const Home home;
  static vmqd::Service& it = *[] {
    auto& table = SampleManager::registered("SAMPLE");
    table.sample = {sampleRow("one", 1, "a"), sampleRow("\"\\\x01", -7, "\xff\xfe")};
    vmqd::ServiceSettings settings;
    settings.node = "node";
    settings.home = home.folder.path();
    settings.depot = home.folder / "depot";
    settings.event_buffer_rows = 2;
    settings.maximum_watchers = 4;
    return new vmqd::Service(settings, vmqhost::listTables());
  }();
  return it;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  fuzz::Input input(data, size);
  const std::string method = methods[input.below(std::size(methods))];
  std::string path = paths[input.below(std::size(paths))];
  path += input.text(256);
  path.resize(std::strlen(path.c_str()));  // the library hands over a text that a zero byte ends
  vmqd::Request request{method, path, {}, {}, {}, {}, -1};
  for (unsigned count = input.below(4); count > 0; --count) {
    const std::string_view name = input.text(64);
    request.arguments.push_back({name, input.text(64)});
  }
  request.representation = input.text(10);
  request.body = input.rest();

  std::string buffer;
  vmqd::Reply reply(buffer);
  vmqd::answer(service(), request, reply);
  fuzz::require(reply.status == 200 || (reply.status >= 400 && reply.status <= 503), "the status is a known one");
  fuzz::require(reply.status != 500, "nothing in a request makes the daemon fail");
  if (reply.stream || reply.content_type != vmqd::jsonType) return 0;
  fuzz::require(nlohmann::json::accept(reply.text), "the answer is JSON");
  const nlohmann::json answered = nlohmann::json::parse(reply.text);
  if (answered.contains("sha256")) {
    fuzz::require(answered["size"] == std::string_view("inside").size(), "only the file of the depot is told about");
  }
  return 0;
}
