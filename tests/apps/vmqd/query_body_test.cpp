// The JSON body of a query, and its predicates.

#include "apps/vmqd/query_body.h"

#include <gmock/gmock.h>

#include <string>
#include <vector>

#include "apps/vmqd/refusal.h"

namespace vmqd {
namespace {

const Table& table() {
  static const Table& it = *new Table(
      {"APP", "T", {{"TEXT", {"text", 0, 8, COLUMN_CHARACTER}}, {"NUMBER", {"number", 8, 4, COLUMN_INTEGER}}}, 12});
  return it;
}

/// "COLUMN operator value;..."
std::string read(const std::string& body) {
  Predicates predicates(table());
  readQueryBody(body, predicates);
  std::string result;
  for (const auto& [column, oper, value] : predicates.request().predicates) {
    result += column + " " + std::to_string(oper) + " " + value + ";";
  }
  return result;
}

/// "code: sentence"
std::string refusalOf(const std::string& body) {
  try {
    return "accepted: " + read(body);
  } catch (const Refusal& refusal) {
    return std::string(refusal.code().name) + ": " + refusal.what();
  }
}

TEST(QueryBody, NamesTheTableItIsFor) {
  EXPECT_EQ("APP", Predicates(table()).request().application);
  EXPECT_EQ("T", Predicates(table()).request().table);
}

TEST(QueryBody, NeedsNoPredicates) {
  EXPECT_EQ("", read("{}"));
  EXPECT_EQ("", read(R"( { "predicates" : { } } )"));
}

TEST(QueryBody, KeepsTheOrderAndRepeatedColumns) {
  EXPECT_EQ("TEXT 1 b;NUMBER 1 7;TEXT 2 a;", read(R"({"predicates":{"TEXT":"b","NUMBER":7,"TEXT":{"ne":"a"}}})"));
}

TEST(QueryBody, KnowsSixOperators) {
  EXPECT_EQ("NUMBER 1 1;NUMBER 2 2;NUMBER 3 3;NUMBER 4 4;NUMBER 5 5;NUMBER 6 6;",
            read(R"({"predicates":{"NUMBER":{"eq":1},"NUMBER":{"ne":2},"NUMBER":{"lt":3},)"
                 R"("NUMBER":{"le":4},"NUMBER":{"gt":5},"NUMBER":{"ge":6}}})"));
}

TEST(QueryBody, AnOperatorCountsForItsOwnColumnOnly) {
  EXPECT_EQ("NUMBER 2 1;TEXT 1 a;", read(R"({"predicates":{"NUMBER":{"ne":1},"TEXT":"a"}})"));
}

TEST(QueryBody, TakesIntegersAndTextForBothKindsOfColumns) {
  EXPECT_EQ("TEXT 1 -5;", read(R"({"predicates":{"TEXT":-5}})"));
  EXPECT_EQ("TEXT 1 18446744073709551615;", read(R"({"predicates":{"TEXT":18446744073709551615}})"));
  EXPECT_EQ("NUMBER 1 -2147483648;", read(R"({"predicates":{"NUMBER":"-2147483648"}})"));
}

TEST(QueryBody, DecodesText) {
  EXPECT_EQ("TEXT 1 a\"\n\u20ac;", read(R"({"predicates":{"TEXT":"a\"\n\u20ac"}})"));
  EXPECT_EQ("TEXT 1 ;", read(R"({"predicates":{"TEXT":""}})"));
}

TEST(QueryBody, TakesTheLongestValue) {
  const std::string longest(65535, 'x');
  EXPECT_EQ("TEXT 1 " + longest + ";", read(R"({"predicates":{"TEXT":")" + longest + R"("}})"));
}

struct Wrong {
  std::string body;
  std::string refusal;
};

const std::string valueOfText =
    "bad_request: The value of \"TEXT\" is not a string, an integer or an object of one operator with one of these.";

const Wrong wrongBodies[] = {
    Wrong{"", "bad_json: The body is not JSON: it goes wrong at byte 1."},
    Wrong{"{", "bad_json: The body is not JSON: it goes wrong at byte 2."},
    Wrong{"{}x", "bad_json: The body is not JSON: it goes wrong at byte 3."},
    Wrong{"{'predicates':{}}", "bad_json: The body is not JSON: it goes wrong at byte 2."},
    Wrong{R"({"predicates":{"TEXT":"a)", "bad_json: The body is not JSON: it goes wrong at byte 25."},
    Wrong{"{\"predicates\":{\"TEXT\":\"\xff\"}}", "bad_json: The body is not JSON: it goes wrong at byte 24."},
    Wrong{R"({"predicates":{"TEXT":"\ud800"}})", "bad_json: The body is not JSON: it goes wrong at byte 30."},
    Wrong{"null", "bad_request: The body is not an object."},
    Wrong{"[]", "bad_request: The body is not an object."},
    Wrong{"7", "bad_request: The body is not an object."},
    Wrong{"\"predicates\"", "bad_request: The body is not an object."},
    Wrong{R"({"predicate":{}})", "bad_request: The body has an unknown member \"predicate\"."},
    Wrong{R"({"predicates":{},"limit":1})", "bad_request: The body has an unknown member \"limit\"."},
    Wrong{R"({"predicates":{},"predicates":{}})", "bad_request: The body has \"predicates\" twice."},
    Wrong{R"({"predicates":null})", "bad_request: \"predicates\" is not an object."},
    Wrong{R"({"predicates":[]})", "bad_request: \"predicates\" is not an object."},
    Wrong{R"({"predicates":"TEXT"})", "bad_request: \"predicates\" is not an object."},
    Wrong{R"({"predicates":1})", "bad_request: \"predicates\" is not an object."},
    Wrong{R"({"predicates":{"TEXT":null}})", valueOfText},
    Wrong{R"({"predicates":{"TEXT":true}})", valueOfText},
    Wrong{R"({"predicates":{"TEXT":1.5}})", valueOfText},
    Wrong{R"({"predicates":{"TEXT":1e2}})", valueOfText},
    Wrong{R"({"predicates":{"TEXT":18446744073709551616}})", valueOfText},
    Wrong{R"({"predicates":{"TEXT":["a"]}})", valueOfText},
    Wrong{R"({"predicates":{"TEXT":{}}})", valueOfText},
    Wrong{R"({"predicates":{"TEXT":{"eq":"a","ne":"b"}}})", valueOfText},
    Wrong{R"({"predicates":{"TEXT":{"eq":{"eq":"a"}}}})", valueOfText},
    Wrong{R"({"predicates":{"TEXT":{"eq":["a"]}}})", valueOfText},
    Wrong{R"({"predicates":{"TEXT":{"eq":null}}})", valueOfText},
    Wrong{R"({"predicates":{"TEXT":{"like":"a"}}})",
          "unknown_operator: \"like\", given for \"TEXT\", is not one of the operators eq, ne, lt, le, gt and ge."},
    Wrong{R"({"predicates":{"TEXT":{"EQ":"a"}}})",
          "unknown_operator: \"EQ\", given for \"TEXT\", is not one of the operators eq, ne, lt, le, gt and ge."},
    Wrong{R"({"predicates":{"NAME":"a"}})", "unknown_column: The table T has no column \"NAME\"."},
    Wrong{R"({"predicates":{"text":"a"}})", "unknown_column: The table T has no column \"text\"."},
    Wrong{R"({"predicates":{"":1}})", "unknown_column: The table T has no column \"\"."},
    Wrong{R"({"predicates":{"TEXT":"a\u0000b"}})", "bad_request: The value of TEXT holds a NUL character."},
    Wrong{R"({"predicates":{"TEXT":")" + std::string(65536, 'x') + R"("}})",
          "bad_request: The value of TEXT is longer than 65535 bytes."},
    Wrong{R"({"predicates":{"NUMBER":"a"}})", "bad_request: The value of NUMBER is not a 32-bit integer."},
    Wrong{R"({"predicates":{"NUMBER":""}})", "bad_request: The value of NUMBER is not a 32-bit integer."},
    Wrong{R"({"predicates":{"NUMBER":"1 "}})", "bad_request: The value of NUMBER is not a 32-bit integer."},
    Wrong{R"({"predicates":{"NUMBER":2147483648}})", "bad_request: The value of NUMBER is not a 32-bit integer."},
    Wrong{R"({"predicates":{"NUMBER":{"ge":-2147483649}}})",
          "bad_request: The value of NUMBER is not a 32-bit integer."}};

TEST(WrongQueryBodies, AreRefusedInOneSentence) {
  for (const auto& each : wrongBodies) {
    EXPECT_EQ(each.refusal, refusalOf(each.body)) << each.body.substr(0, 100);
  }
}

TEST(QueryBody, DeepNestingIsRefusedAtOnce) {
  EXPECT_EQ("bad_request: The body is not an object.", refusalOf(std::string(1000000, '[')));
}

TEST(QueryBody, LongNamesAreCutInWhatIsSaid) {
  EXPECT_EQ("unknown_column: The table T has no column \"" + std::string(100, 'N') + "...\".",
            refusalOf(R"({"predicates":{")" + std::string(5000, 'N') + R"(":1}})"));
}

TEST(PredicateValues, ThatAreNotUtf8AreRefused) {
  Predicates predicates(table());
  try {
    predicates.add("TEXT", INTF_EQ, "\xff");
    FAIL() << "accepted";
  } catch (const Refusal& refusal) {
    EXPECT_EQ("bad_request", refusal.code().name);
    EXPECT_STREQ("The value of TEXT is not UTF-8.", refusal.what());
  }
}

}  // namespace
}  // namespace vmqd
