#include "apps/vmqctl/predicates.h"

#include <gmock/gmock.h>

#include "apps/vmqctl/failure.h"

namespace {

using vmqctl::ExitCode;
using vmqctl::Failure;
using vmqctl::parsePredicate;
using vmqctl::Predicate;
using vmqctl::Predicates;
using vmqctl::toJson;
using vmqctl::toQueryString;

struct Case {
  const char* text;
  Predicate predicate;
};

TEST(Predicates, EachOperatorIsRead) {
  const Case cases[] = {
      {"PRODUCT=ux", {"PRODUCT", "eq", "ux"}},   {"RETVAL!=0", {"RETVAL", "ne", "0"}},
      {"RETVAL<0", {"RETVAL", "lt", "0"}},       {"RETVAL<=0", {"RETVAL", "le", "0"}},
      {"RETVAL>0", {"RETVAL", "gt", "0"}},       {"RETVAL>=0", {"RETVAL", "ge", "0"}},
      {"PRODUCT=", {"PRODUCT", "eq", ""}},       {"PRODUCT!=", {"PRODUCT", "ne", ""}},
      {"CONTEXT=a=b", {"CONTEXT", "eq", "a=b"}}, {"CONTEXT==x", {"CONTEXT", "eq", "=x"}},
      {"CONTEXT=<x>", {"CONTEXT", "eq", "<x>"}}, {"CONTEXT= a\nb", {"CONTEXT", "eq", " a\nb"}},
      {"RETVAL=>5", {"RETVAL", "eq", ">5"}},  // not an operator: the first sign decides
  };
  for (const Case& c : cases) {
    const Predicate read = parsePredicate(c.text);
    EXPECT_EQ(std::tie(read.column, read.op, read.value),
              std::tie(c.predicate.column, c.predicate.op, c.predicate.value))
        << c.text;
  }
}

TEST(Predicates, EverythingElseIsAUsageError) {
  for (const char* text : {"", "PRODUCT", "=ux", "!=ux", "<1", "PRODUCT!ux", "!"}) {
    try {
      (void)parsePredicate(text);
      ADD_FAILURE() << "accepted: " << text;
    } catch (const Failure& failure) {
      EXPECT_EQ(failure.code(), ExitCode::Usage);
      EXPECT_EQ(failure.what(), "\"" + std::string(text) + "\" is not of the form COLUMN=VALUE.");
    }
  }
}

TEST(Predicates, JsonKeepsTheirOrder) {
  EXPECT_EQ(toJson({{"TRANSID", "eq", "t1"}, {"COMMAND", "eq", "START"}, {"RETVAL", "ne", "0"}}).dump(),
            R"({"TRANSID":"t1","COMMAND":"START","RETVAL":{"ne":"0"}})");
  EXPECT_EQ(toJson({}).dump(), "{}");
}

TEST(Predicates, ColumnGivenTwiceIsAUsageError) {
  EXPECT_THROW((void)toJson({{"A", "ge", "1"}, {"A", "le", "5"}}), Failure);
}

TEST(Predicates, QueryStringIsPercentEncoded) {
  EXPECT_EQ(toQueryString({{"TRANSID", "eq", "t1"}, {"RETVAL", "ne", "0"}}), "TRANSID=t1&RETVAL.ne=0");
  EXPECT_EQ(toQueryString({{"A", "eq", "a b&c=d+e%/?#"}}), "A=a%20b%26c%3Dd%2Be%25%2F%3F%23");
  EXPECT_EQ(toQueryString({{"A", "eq", "\xC3\xBC\n"}}), "A=%C3%BC%0A");
  EXPECT_EQ(toQueryString({{"A", "eq", "Az09-._~"}}), "A=Az09-._~");
  EXPECT_EQ(toQueryString({}), "");
}

}  // namespace
