#include "bench/report_rows.h"

namespace {

const Figure none{"", ""};
const Aim noSlower{Aim::AtMost, 1.0};
const Aim noAim{};

Aim atMost(double bound) {
  return {Aim::AtMost, bound};
}

Aim atLeast(double bound) {
  return {Aim::AtLeast, bound};
}

/// The same job done by ours and by a twin, at several sizes: NAME/vmq/SIZE beside NAME/TWIN/SIZE.
struct Twins {
  const char* what;
  const char* name;
  const char* twin;
  std::vector<int> sizes;
  Aim aim;
};

void addTwins(std::vector<Row>& rows, const std::vector<Twins>& all) {
  for (const Twins& twins : all) {
    for (const int size : twins.sizes) {
      const std::string number = std::to_string(size);
      const std::string name = twins.name;
      rows.push_back({twins.what + (", " + number),
                      {name + "/vmq/" + number},
                      {name + "/" + twins.twin + "/" + number},
                      twins.aim,
                      ""});
    }
  }
}

/// Two figures of one benchmark that measures both in turns.
Row ofOne(const std::string& what, const std::string& benchmark, const char* ours, const char* baseline, Aim aim,
          const char* unit) {
  return {what, {benchmark, ours}, {benchmark, baseline}, aim, unit};
}

}  // namespace

std::vector<Row> reportRows() {
  std::vector<Row> rows = {
      {"run /bin/true from 20 MiB", {"RunTrue/MiB:20"}, {"SpawnTrue/MiB:20"}, atMost(1.3), ""},
      {"run /bin/true from 1 GiB", {"RunTrue/MiB:1024"}, {"SpawnTrue/MiB:1024"}, atMost(1.3), ""},
      {"collect 64 MiB of output, rate",
       {"RunMuch", "bytes_per_second"},
       {"SpawnMuch", "bytes_per_second"},
       atLeast(0.8),
       ""},
  };
  addTwins(rows, {{"text: append one by one", "append", "std", {16, 256, 16384}, noSlower},
                  {"text: append texts of", "append_text", "std", {4, 64}, noSlower},
                  {"text: copy", "copy", "std", {16, 4096}, noSlower},
                  {"text: find in", "find", "std", {64, 4096}, noSlower},
                  {"text: find in a run of", "find_in_run", "std", {4096}, noSlower},
                  {"text: replace in", "replace", "std", {64, 4096}, noSlower},
                  {"ASCII to text", "widen", "sse2", {16, 64, 4096}, atMost(2)},
                  {"text to ASCII", "narrow", "sse2", {16, 64, 4096}, atMost(2)},
                  {"map: put", "put", "std", {8, 64, 1024}, noSlower},
                  {"map: put again", "put_again", "std", {8, 64, 1024}, noSlower},
                  {"map: get", "get", "std", {8, 64, 1024}, noSlower},
                  {"map: get what is not there", "get_absent", "std", {8, 64, 1024}, noSlower}});
  const std::vector<Row> others = {
      {"XML tree of a run-as file, 1 MiB", {"parseWithDom/runas"}, {"parseWithExpat/runas"}, atMost(2.5), ""},
      {"XML tree of records, 1 MiB", {"parseWithDom/records"}, {"parseWithExpat/records"}, atMost(2.5), ""},
      {"hand a request to the executor", {"theQueue"}, {"bareQueue"}, atMost(1.3), ""},
      {"traced routine on 2 bytes, trace off", {"run/trace_off_2_bytes"}, {"run/untraced_2_bytes"}, noAim, ""},
      {"traced routine on 64 bytes, trace off", {"run/trace_off_64_bytes"}, {"run/untraced_64_bytes"}, noAim, ""},
      ofOne("KAGREQT query beside an empty one, median", "KagreqtAgainstEmptyRoundTrip", "kagreqt_p50_us",
            "empty_p50_us", atMost(1.3), "us"),
      {"idle daemon, resident", {"KagreqtAgainstEmptyRoundTrip", "idle_rss_kB"}, none, atMost(10240), "kB"},
      ofOne("inventory, 10 products", "InventoryAgainstItsCommands/products:10", "sampled_ms", "commands_ms", noAim,
            "ms"),
      ofOne("inventory, 1000 products", "InventoryAgainstItsCommands/products:1000", "sampled_ms", "commands_ms", noAim,
            "ms"),
      ofOne("inventory, 10000 products", "InventoryAgainstItsCommands/products:10000", "sampled_ms", "commands_ms",
            noAim, "ms"),
      ofOne("GETCONFIG beside its commands", "GetConfigAgainstTheTranslator", "getconfig_us", "commands_us", noAim,
            "us"),
      ofOne("a request that does nothing, of 1000", "RequestsThatDoNothing/requests:1000", "us_per_request",
            "us_per_payload", noAim, "us"),
      ofOne("push a large file, rate beside cp", "PushOfOneLargeFile", "push_MiB_per_s", "cp_MiB_per_s", atLeast(0.5),
            "MiB/s"),
      ofOne("push a large file, rate beside the empty route", "PushOfOneLargeFile", "push_MiB_per_s",
            "empty_route_MiB_per_s", atLeast(0.8), "MiB/s"),
      ofOne("push 1000 small files, rate beside cp", "PushOfAThousandSmallFiles", "push_MiB_per_s", "cp_MiB_per_s",
            noAim, "MiB/s"),
      ofOne("push 1000 small files, rate beside the empty route", "PushOfAThousandSmallFiles", "push_MiB_per_s",
            "empty_route_MiB_per_s", noAim, "MiB/s"),
  };
  rows.insert(rows.end(), others.begin(), others.end());
  return rows;
}
