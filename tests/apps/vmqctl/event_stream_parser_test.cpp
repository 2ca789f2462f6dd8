#include "apps/vmqctl/event_stream_parser.h"

#include <gmock/gmock.h>

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using vmqctl::EventStreamParser;
using vmqctl::ServerSentEvent;
using Events = std::vector<ServerSentEvent>;

Events takeAll(EventStreamParser& parser) {
  Events events;
  while (auto event = parser.take()) events.push_back(*event);
  return events;
}

Events parsed(std::initializer_list<std::string_view> pieces) {
  EventStreamParser parser;
  for (const std::string_view piece : pieces) EXPECT_TRUE(parser.feed(piece));
  return takeAll(parser);
}

TEST(EventStreamParser, EventIsDeliveredAtItsBlankLine) {
  EventStreamParser parser;
  ASSERT_TRUE(parser.feed("event: open\ndata: {\"table\":\"KAGDYST\"}\n"));
  EXPECT_FALSE(parser.take());
  ASSERT_TRUE(parser.feed("\n"));
  EXPECT_EQ(parser.take(), (ServerSentEvent{"open", "{\"table\":\"KAGDYST\"}"}));
  EXPECT_FALSE(parser.take());
}

struct Case {
  const char* name;
  std::string stream;
  Events events;
};

void PrintTo(const Case& c, std::ostream* out) {
  *out << c.name;
}

class EventStreams : public testing::TestWithParam<Case> {};

TEST_P(EventStreams, AreReadWhole) {
  EXPECT_EQ(parsed({GetParam().stream}), GetParam().events);
}

TEST_P(EventStreams, AreReadInTwoPiecesWhereverTheyAreCut) {
  const std::string_view stream = GetParam().stream;
  for (std::size_t cut = 0; cut <= stream.size(); ++cut) {
    EXPECT_EQ(parsed({stream.substr(0, cut), stream.substr(cut)}), GetParam().events) << "cut at " << cut;
  }
}

TEST_P(EventStreams, AreReadByteByByte) {
  EventStreamParser parser;
  for (const char c : GetParam().stream) ASSERT_TRUE(parser.feed(std::string_view(&c, 1)));
  EXPECT_EQ(takeAll(parser), GetParam().events);
}

INSTANTIATE_TEST_SUITE_P(
    Forms, EventStreams,
    testing::Values(Case{"Nothing", "", {}}, Case{"OneEvent", "event: row\ndata: {}\n\n", {{"row", "{}"}}},
                    Case{"TwoEvents", "event: row\ndata: 1\n\nevent: lost\ndata: 2\n\n", {{"row", "1"}, {"lost", "2"}}},
                    Case{"NoName", "data: x\n\n", {{"message", "x"}}},
                    Case{"NameIsNotKept", "event: row\ndata: 1\n\ndata: 2\n\n", {{"row", "1"}, {"message", "2"}}},
                    Case{"SeveralDataLines", "data: a\ndata:\ndata: b\n\n", {{"message", "a\n\nb"}}},
                    Case{"OneBlankBehindTheColonIsDropped", "data:  a\ndata:b\n\n", {{"message", " a\nb"}}},
                    Case{"ColonsInTheValue", "data: {\"a\":\"b: c\"}\n\n", {{"message", "{\"a\":\"b: c\"}"}}},
                    Case{"FieldWithoutColon", "data\n\n", {{"message", ""}}},
                    Case{"NoDataNoEvent", "event: row\n\n", {}},
                    Case{"Comments", ": keep-alive\n\n: keep-alive\nevent: row\n:\ndata: 1\n\n", {{"row", "1"}}},
                    Case{"OtherFields", "id: 7\nretry: 10\nfoo: bar\ndata: 1\n\n", {{"message", "1"}}},
                    Case{"CarriageReturns", "event: row\rdata: 1\r\r", {{"row", "1"}}},
                    Case{"CarriageReturnLineFeeds", "event: row\r\ndata: 1\r\n\r\n", {{"row", "1"}}},
                    Case{"MixedLineEnds", "event: row\r\ndata: 1\n\rdata: 2\r\r\n", {{"row", "1"}, {"message", "2"}}},
                    Case{"ByteOrderMark",
                         "\xEF\xBB\xBF"
                         "data: 1\n\n",
                         {{"message", "1"}}},
                    Case{"CutOffEvent", "data: 1\n\ndata: 2\n", {{"message", "1"}}},
                    Case{"CutOffLine", "data: 1\n\ndata: 2", {{"message", "1"}}}),
    [](const auto& instance) { return std::string(instance.param.name); });

TEST(EventStreamParser, EventAsLongAsAllowedIsRead) {
  const std::string data(EventStreamParser::maximumEventBytes - std::string_view("data: ").size(), 'x');
  EXPECT_THAT(parsed({"data: " + data + "\n\n"}), ElementsAre(ServerSentEvent{"message", data}));
}

TEST(EventStreamParser, EndlessLineIsRefusedForGood) {
  EventStreamParser parser;
  EXPECT_FALSE(parser.feed(std::string(EventStreamParser::maximumEventBytes + 1, 'x')));
  EXPECT_FALSE(parser.feed("\n\ndata: 1\n\n"));
  EXPECT_THAT(takeAll(parser), IsEmpty());
}

TEST(EventStreamParser, EndlessEventOfShortLinesIsRefused) {
  EventStreamParser parser;
  bool accepted = true;
  for (unsigned lines = 0; accepted && lines < 4096; ++lines)
    accepted = parser.feed("data: " + std::string(1024, 'x') + "\n");
  EXPECT_FALSE(accepted);
}

}  // namespace
