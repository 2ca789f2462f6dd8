// The inventory table: what the installation's tools print, and the rows that come of it.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "test_seam.h"
#include "tests/mgmt/running_component.h"
#include "tests/support/failing_allocation.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

const std::string kHeader = "\"ProdCode\",\"Description\",\"Platform\",\"Version\",\"Release\"\n";

/// A row of the table as a test writes it down.
struct Product {
  std::string product, version, description, release, platform;
  std::string os = "Linux", arch = "lx8266";
};

std::string column(const std::string& text, size_t width) {
  return text.substr(0, width) + std::string(width - std::min(width, text.size()), ' ');
}

class InventoryTable : public testing::Test {
 protected:
  InventoryTable() : home(runningComponent()) { architecture("os=Linux; cArch=lx8266"); }

  void architecture(const std::string& script) { home.file("bin/dynarch.shl", script + "\n"); }
  /// What the inventory tool prints for an option.
  void inventory(const std::string& option, const std::string& output) {
    home.file("listing" + option, output);
    home.tool("bin/qinfo", "cat '" + home.path() + "/listing'$1");
  }
  static std::vector<std::string> ask(const std::vector<RequestDetail::Predicate>& predicates = {}) {
    vmqhost::RowBuffer rows(10000);
    const auto request = vmqhost::OpenRequest::open(query("KINAGT", predicates), rows);
    EXPECT_EQ(request->sample(), 0u);
    std::vector<std::string> taken;
    for (;;) {
      vmqhost::RowBuffer::Item item = rows.take(std::chrono::milliseconds(0));
      if (item.kind != vmqhost::RowBuffer::Item::kRow) return taken;
      taken.push_back(item.row);
    }
  }
  [[nodiscard]] std::string architectureProbe() const {
    return "/bin/ksh -c '. " + home.path() + "/bin/dynarch.shl " + home.path() +
           "/registry/archdsc.tbl >/dev/null 2>&1;echo ArchitectureHeader;echo $os;echo $cArch'";
  }
  [[nodiscard]] std::string row(const Product& p) const {
    return column(kNode, 64) + column(home.path(), 512) + column(p.os, 5) + column(p.arch, 10) + column(p.product, 32) +
           column(p.version, 12) + column(p.description, 80) + column(p.release, 12) + column(p.platform, 20);
  }
  static std::string line(const Product& p) {
    return "\"" + p.product + "\",\"" + p.description + "\",\"" + p.platform + "\",\"" + p.version + "\",\"" +
           p.release + "\"\n";
  }

  InstallationHome& home;
  TEST_TraceCapture trace;
};

const Product kUnix{"ux", "062000000", "Unix agent", "100", "lx8266"};
const Product kLibraries{"ax", "062000001", "Shared libraries", "100", "lx8266"};

TEST_F(InventoryTable, ListsWhatIsInstalledAndWhatElseIsKnown) {
  inventory("-x", kHeader + line(kLibraries));
  inventory("-d", "Some text\n" + kHeader + line(kUnix));
  EXPECT_THAT(ask(), ElementsAre(row(kUnix), row(kLibraries)));
  EXPECT_THAT(commandLines(trace),
              ElementsAre(architectureProbe(), home.path() + "/bin/qinfo -d", home.path() + "/bin/qinfo -x"));
  std::string product = line(kUnix);
  product.pop_back();
  for (const std::string& text :
       {std::string("$os = Linux, $cArch = lx8266"), "qinfo command is: [" + home.path() + "/bin/qinfo -d]",
        std::string("Index of inventory header is 10"), std::string("Index of newline after inventory header is : 65"),
        "Found product line: " + product})
    EXPECT_TRUE(trace.has(RAS1_DETAIL, text)) << text;
}

TEST_F(InventoryTable, RunningProductsAreAskedForAlone) {
  inventory("-r", kHeader + line(kUnix));
  Product asked = kUnix;
  asked.description = "RUNNING now";
  EXPECT_THAT(ask({equal("PRODDESC", "  RUNNING now ")}), IsEmpty());  // the row holds the trimmed value
  EXPECT_THAT(ask({{"PRODDESC", INTF_EQ, "RUNNING now"}}), ElementsAre(row(asked)));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Product Description is: RUNNING now"));
  const std::string running = home.path() + "/bin/qinfo -r";
  EXPECT_THAT(commandLines(trace), ElementsAre(architectureProbe(), running, architectureProbe(), running));
}

TEST_F(InventoryTable, AnyOtherDescriptionAsksForBothAndStandsInEachRow) {
  inventory("-x", kHeader);
  inventory("-d", kHeader + line(kUnix));
  Product asked = kUnix;
  asked.description = "mine";
  EXPECT_THAT(ask({equal("PRODDESC", "mine")}), ElementsAre(row(asked)));
  EXPECT_THAT(commandLines(trace),
              ElementsAre(architectureProbe(), home.path() + "/bin/qinfo -d", home.path() + "/bin/qinfo -x"));
}

TEST_F(InventoryTable, RepeatedLineIsReturnedOnceForEachRun) {
  inventory("-x", kHeader + line(kUnix));
  inventory("-d", kHeader + line(kUnix) + line(kLibraries) + line(kUnix));
  EXPECT_THAT(ask(), ElementsAre(row(kUnix), row(kLibraries), row(kUnix)));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "skipping duplicate info in this line"));
}

TEST_F(InventoryTable, EightCharacterVersionIsWidened) {
  inventory("-x", kHeader);
  Product seven = kUnix, eight = kUnix, nine = kUnix;
  seven.version = "1234567";
  eight.version = "12345678";
  nine.version = "123456789";
  inventory("-d", kHeader + line(seven) + line(eight) + line(nine));
  eight.version = "123456078";
  EXPECT_THAT(ask(), ElementsAre(row(seven), row(eight), row(nine)));
}

TEST_F(InventoryTable, DuplicatesAreJudgedAfterTheVersionIsWidened) {
  inventory("-x", kHeader);
  Product eight = kUnix, nine = kUnix;
  eight.version = "12345678";
  nine.version = "123456078";
  inventory("-d", kHeader + line(eight) + line(nine));
  EXPECT_THAT(ask(), ElementsAre(row(nine)));
}

TEST_F(InventoryTable, ShortLineIsSkippedAndTheNextIsTaken) {
  inventory("-x", kHeader);
  inventory("-d", kHeader + "\"ux\",\"Unix\",\"lx8266\",\"06\"\n" + line(kLibraries));
  EXPECT_THAT(ask(), ElementsAre(row(kLibraries)));
  EXPECT_TRUE(trace.has(RAS1_ERROR,
                        "Product line has 4 fields, expecting 5 fields.  Product line is: "
                        "\"ux\",\"Unix\",\"lx8266\",\"06\""));
}

TEST_F(InventoryTable, FieldsBehindTheFifthAreIgnored) {
  inventory("-x", kHeader);
  inventory("-d", kHeader + "\"ux\",\"Unix\",\"lx8266\",\"06\",\"100\",\"more\"\n");
  EXPECT_THAT(ask(), ElementsAre(row({"ux", "06", "Unix", "100", "lx8266"})));
}

TEST_F(InventoryTable, PredicatesDecideWhichProductsAreListed) {
  inventory("-x", kHeader);
  inventory("-d", kHeader + line(kUnix) + line(kLibraries));
  EXPECT_THAT(ask({equal("PRODUCT", "ax")}), ElementsAre(row(kLibraries)));
}

TEST_F(InventoryTable, ArchitectureThatIsNotToldIsBlank) {
  inventory("-x", kHeader);
  inventory("-d", kHeader + line(kUnix));
  Product unknown = kUnix;
  unknown.os = unknown.arch = "";
  architecture("os=Linux; cArch=; exit 0");  // ends before the header is printed
  EXPECT_THAT(ask(), ElementsAre(row(unknown)));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Could not find header ArchitectureHeader in output"));
}

TEST_F(InventoryTable, ArchitectureScriptThatFailsLeavesBlanks) {
  inventory("-x", kHeader);
  inventory("-d", kHeader + line(kUnix));
  Product unknown = kUnix;
  unknown.os = unknown.arch = "";
  architecture("exit 3");
  EXPECT_THAT(ask(), ElementsAre(row(unknown)));
}

TEST_F(InventoryTable, HalfAnArchitectureIsNone) {
  inventory("-x", kHeader);
  inventory("-d", kHeader + line(kUnix));
  Product unknown = kUnix;
  unknown.os = unknown.arch = "";
  architecture("os=Linux");
  EXPECT_THAT(ask(), ElementsAre(row(unknown)));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Expected 3 tokens, Header and $os and $cArch, but we got 2 tokens"));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Received token ***ArchitectureHeader***"));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Received token ***Linux***"));
}

TEST_F(InventoryTable, MissingToolGivesNoRows) {
  EXPECT_THAT(ask(), IsEmpty());
}

TEST_F(InventoryTable, FailingToolGivesNoRows) {
  home.tool("bin/qinfo", "printf '" + kHeader + line(kUnix) + "'; exit 1");
  EXPECT_THAT(ask(), IsEmpty());
}

TEST_F(InventoryTable, ListingWithoutItsHeaderGivesNoRows) {
  inventory("-x", "");
  inventory("-d", line(kUnix));
  EXPECT_THAT(ask(), IsEmpty());
  EXPECT_TRUE(
      trace.has(RAS1_ERROR, "Inventory header string " + kHeader.substr(0, kHeader.size() - 1) + ", not found"));
}

TEST_F(InventoryTable, HeaderWithoutALineEndGivesNoRows) {
  inventory("-x", "");
  inventory("-d", kHeader.substr(0, kHeader.size() - 1));
  EXPECT_THAT(ask(), IsEmpty());
  EXPECT_TRUE(trace.has(RAS1_ERROR, "No newline character '\n' found after Inventory header"));
}

TEST_F(InventoryTable, HeaderWithNothingBehindItGivesNoRows) {
  inventory("-x", kHeader + "\n\n\r\n");
  inventory("-d", kHeader);
  EXPECT_THAT(ask(), IsEmpty());
}

TEST_F(InventoryTable, FirstHeaderCountsAndALaterOneIsAProduct) {
  inventory("-x", "");
  inventory("-d", kHeader + line(kUnix) + kHeader);
  EXPECT_THAT(ask(), ElementsAre(row(kUnix), row({"ProdCode", "Version", "Description", "Release", "Platform"})));
}

TEST_F(InventoryTable, CommaInADescriptionMovesTheFieldsBehindIt) {
  inventory("-x", "");
  inventory("-d", kHeader + "\"ux\",\"Unix, and more\",\"lx8266\",\"06\",\"100\"\n" + line(kLibraries));
  EXPECT_THAT(ask(), ElementsAre(row({"ux", "lx8266", "Unix", "06", " and more"}), row(kLibraries)));
}

TEST_F(InventoryTable, EmptyFieldsVanishSoThatTheirLineIsTooShort) {
  inventory("-x", "");
  inventory("-d", kHeader + "\"ux\",\"\",\"lx8266\",\"06\",\"100\"\n,,,,\n\"\n" + line(kLibraries));
  EXPECT_THAT(ask(), ElementsAre(row(kLibraries)));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Product line has 0 fields, expecting 5 fields.  Product line is: ,,,,"));
}

TEST_F(InventoryTable, LinesOfAnotherSystemAndWithoutQuotesAreRead) {
  inventory("-x", "");
  inventory("-d", kHeader.substr(0, kHeader.size() - 1) + "\r\nux,Unix agent,lx8266,062000000,100\r\n");
  EXPECT_THAT(ask(), ElementsAre(row(kUnix)));
}

TEST_F(InventoryTable, ListingWithoutALineEndIsReadToItsEnd) {
  inventory("-x", "");
  const std::string last = line(kUnix);
  inventory("-d", kHeader + last.substr(0, last.size() - 1));
  EXPECT_THAT(ask(), ElementsAre(row(kUnix)));
}

TEST_F(InventoryTable, OneInventoryThatFailsLeavesTheOther) {
  home.file("listing-x", kHeader + line(kLibraries));
  home.tool("bin/qinfo", "cat '" + home.path() + "/listing'$1");  // there is no listing-d, so it fails
  EXPECT_THAT(ask(), ElementsAre(row(kLibraries)));
}

TEST_F(InventoryTable, ToolThatPrintsManyZeroBytesIsReadWithoutATraceLineForEach) {
  home.file("listing", kHeader + line(kUnix));
  home.tool("bin/qinfo", "head -c 1048576 /dev/zero >&2; [ $1 = -x ] || cat '" + home.path() + "/listing'");
  EXPECT_THAT(ask(), ElementsAre(row(kUnix)));
  EXPECT_LT(trace.lines().size(), 10000u);
}

TEST_F(InventoryTable, ToolEndedByASignalGivesNoRows) {
  home.file("listing", kHeader + line(kUnix));
  home.tool("bin/qinfo", "cat '" + home.path() + "/listing'; kill -9 $$");
  EXPECT_THAT(ask(), IsEmpty());
}

TEST_F(InventoryTable, ListingThatDoesNotFitIntoMemoryGivesNoRowsAndTheNextQueryAll) {
  const std::string listing = kHeader + line(kUnix) + std::string(100000, 'x');
  inventory("-x", kHeader);
  inventory("-d", listing);
  {
    const FailingAllocation failing(listing.size());
    EXPECT_THAT(ask(), IsEmpty());
    EXPECT_TRUE(failing.happened());
  }
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Exception while listing the installed products: std::bad_alloc"));
  EXPECT_THAT(ask(), ElementsAre(row(kUnix)));
}

TEST_F(InventoryTable, DescriptionOfBlanksOnlyIsNone) {
  inventory("-x", "");
  inventory("-d", kHeader + line(kUnix));
  // The row holds the tool's description, which the predicate does not let pass; "not equal" does.
  EXPECT_THAT(ask({{"PRODDESC", INTF_NE, "   "}}), ElementsAre(row(kUnix)));
}

TEST_F(InventoryTable, RunningInAnyOtherCaseAsksForBoth) {
  inventory("-r", "");
  inventory("-x", "");
  inventory("-d", kHeader + line(kUnix));
  Product asked = kUnix;
  asked.description = "running";
  EXPECT_THAT(ask({equal("PRODDESC", "running")}), ElementsAre(row(asked)));
  EXPECT_THAT(commandLines(trace),
              ElementsAre(architectureProbe(), home.path() + "/bin/qinfo -d", home.path() + "/bin/qinfo -x"));
}

TEST_F(InventoryTable, LongValuesAreCutAtTheirColumns) {
  inventory("-x", kHeader);
  Product longer = kUnix;
  longer.description = std::string(100, 'd');
  longer.release = "a release with a long name";
  inventory("-d", kHeader + line(longer));
  EXPECT_THAT(ask(), ElementsAre(row(longer)));
}

TEST_F(InventoryTable, ThousandProductsAreThousandRows) {
  inventory("-x", kHeader);
  std::string listing = kHeader;
  for (int i = 0; i < 1000; ++i) listing += line({"p" + std::to_string(i), "06", "Product", "100", "lx8266"});
  inventory("-d", listing);
  EXPECT_THAT(ask(), SizeIs(1000));
}

}  // namespace
