#include "tasks/product_arch.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/tasks/installation_home.h"

namespace {

using testing::ElementsAre;

const std::string kHeader = "\"ProdCode\",\"Description\",\"Platform\",\"Version\",\"Release\"";

class ProductLookups : public testing::Test {
 protected:
  void inventory(const std::string& output) {
    home.file("listing", output);
    home.tool("bin/qinfo", "cat '" + home.path() + "/listing'");
  }
  static std::string line(const std::string& product, const std::string& platform) {
    return "\"" + product + "\",\"Some product\",\"" + platform + "\",\"062000000\",\"100\"\n";
  }
  std::string sharedLibArch(const char* product, const char* hint = "") {
    return getSharedLibArch(product, hint).toNarrow();
  }

  InstallationHome home;
  TEST_TraceCapture trace;
};

// ---- the inventory listing -----------------------------------------------------------------------------------------

TEST_F(ProductLookups, ProductIsFoundInTheInventory) {
  inventory("before\n" + kHeader + "\n" + line("ax", "lx8266") + line("ux", "lx8266"));
  EXPECT_TRUE(isProductInStandardInventory("ux"));
  EXPECT_THAT(commandLines(trace), ElementsAre(home.path() + "/bin/qinfo -d "));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Looking for product code ux"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "product code [ux] found with [" + home.path() + "/bin/qinfo -d ]"));
}

TEST_F(ProductLookups, ProductIsComparedExactly) {
  inventory(kHeader + "\n" + line("ux", "lx8266"));
  for (const char* other : {"UX", "u", "uxx", ""}) EXPECT_FALSE(isProductInStandardInventory(other)) << other;
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "product code [UX] is not found with [" + home.path() + "/bin/qinfo -d ]"));
}

TEST_F(ProductLookups, DescriptionWithACommaHidesItsLineOnly) {
  inventory(kHeader + "\n\"ux\",\"Unix, and more\",\"lx8266\",\"062000000\",\"100\"\n" + line("ax", "lx8266"));
  EXPECT_FALSE(isProductInStandardInventory("ux"));
  EXPECT_TRUE(trace.has(RAS1_ERROR,
                        "Product line has 6 fields, expecting 5 fields.  Product line is: "
                        "\"ux\",\"Unix, and more\",\"lx8266\",\"062000000\",\"100\""));
  EXPECT_TRUE(isProductInStandardInventory("ax"));
}

TEST_F(ProductLookups, ShortLineIsSkipped) {
  inventory(kHeader + "\n\"ux\",\"Unix\",\"lx8266\",\"062000000\"\n" + line("ux", "aix533"));
  EXPECT_EQ(sharedLibArch("ux"), "aix533");
  EXPECT_TRUE(trace.hasPrefix(RAS1_ERROR, "Product line has 4 fields, expecting 5 fields.  Product line is: "));
}

TEST_F(ProductLookups, ToolThatIsMissingFindsNothing) {
  EXPECT_FALSE(isProductInStandardInventory("ux"));
  EXPECT_EQ(sharedLibArch("ux"), "");
  EXPECT_EQ(getProductArch("ux").length(), 0u);
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Bad return code from Util::runCommand"));
}

TEST_F(ProductLookups, ToolThatFailsFindsNothing) {
  home.tool("bin/qinfo", "printf '%s\\n' '" + kHeader + "' '" + line("ux", "lx8266") + "'; exit 1");
  EXPECT_FALSE(isProductInStandardInventory("ux"));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Bad return code from Util::runCommand"));
}

TEST_F(ProductLookups, ListingWithoutItsHeaderFindsNothing) {
  inventory(line("ux", "lx8266"));
  EXPECT_EQ(sharedLibArch("ux"), "");
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Inventory header string " + kHeader + ", not found"));
}

TEST_F(ProductLookups, HeaderWithoutALineEndFindsNothing) {
  inventory(kHeader);
  EXPECT_EQ(sharedLibArch("ux"), "");
  EXPECT_TRUE(trace.has(RAS1_ERROR, "No newline character '\n' found after Inventory header"));
}

TEST_F(ProductLookups, HeaderWithNothingBehindItFindsNothing) {
  inventory(kHeader + "\n");
  EXPECT_EQ(sharedLibArch("ux"), "");
  EXPECT_FALSE(isProductInStandardInventory("ux"));
}

// ---- the architecture of libraries ---------------------------------------------------------------------------------

TEST_F(ProductLookups, FirstLineWinsWithoutAHint) {
  inventory(kHeader + "\n" + line("ux", "aix533") + line("ux", "lx8266"));
  EXPECT_EQ(sharedLibArch("ux"), "aix533");
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Looking for product code ux"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Architecture for product code [ux] is [aix533]"));
}

TEST_F(ProductLookups, LineThatEndsLikeTheHintStopsTheSearch) {
  inventory(kHeader + "\n" + line("ux", "aix533") + line("ux", "lx8266") + line("ux", "hpi116"));
  EXPECT_EQ(sharedLibArch("ux", "li6266"), "lx8266");
}

TEST_F(ProductLookups, LastLineWinsWhenNoneEndsLikeTheHint) {
  inventory(kHeader + "\n" + line("ux", "aix533") + line("ux", "lx8266"));
  EXPECT_EQ(sharedLibArch("ux", "sol509"), "lx8266");
}

TEST_F(ProductLookups, HintOfAnotherLengthNeverMatches) {
  inventory(kHeader + "\n" + line("ux", "aix533") + line("ux", "lx8266"));
  EXPECT_EQ(sharedLibArch("ux", "33"), "lx8266");
}

TEST_F(ProductLookups, HintThatMatchesTheLastCharacterOnlyDoesNotStop) {
  inventory(kHeader + "\n" + line("ux", "aix533") + line("ux", "lx8266"));
  EXPECT_EQ(sharedLibArch("ux", "aix543"), "lx8266");
}

TEST_F(ProductLookups, OneCharacterMatchesNothing) {
  inventory(kHeader + "\n" + line("ux", "3") + line("ux", "4"));
  EXPECT_EQ(sharedLibArch("ux", "3"), "4");
}

TEST_F(ProductLookups, PlatformsWithoutSharedLibrariesAreSkippedForAx) {
  for (const char* skipped : {"aix433", "hp102", "sol273", "sol276", "sol278", "sol288"}) {
    inventory(kHeader + "\n" + line("ax", skipped) + line("ax", "lx8266"));
    EXPECT_EQ(sharedLibArch("ax"), "lx8266") << skipped;
    inventory(kHeader + "\n" + line("ux", skipped));
    EXPECT_EQ(sharedLibArch("ux"), skipped);
  }
}

TEST_F(ProductLookups, SharedLibrariesAreThoseThatFitTheUnixAgent) {
  inventory(kHeader + "\n" + line("ax", "aix533") + line("ax", "lx8266") + line("ux", "li6266"));
  EXPECT_EQ(getSharedLibArchDir().toNarrow(), home.path() + "/zlpqor6/lx8266/bin");
  EXPECT_TRUE(trace.has(
      RAS1_DETAIL, "Architecture directory for Shared Lib [lx8266] is is [" + home.path() + "/zlpqor6/lx8266/bin]"));
}

TEST_F(ProductLookups, NoSharedLibrariesNoDirectory) {
  inventory(kHeader + "\n" + line("ux", "lx8266"));
  EXPECT_EQ(getSharedLibArchDir().toNarrow(), "");
}

// ---- the platform listing ------------------------------------------------------------------------------------------

TEST_F(ProductLookups, ArchitectureOfAProductIsInThePlatformListing) {
  inventory("Platform codes:\naix533 Product (ux)\nlx8266 Product (um)\nlx6266: Product (um)\n");
  EXPECT_EQ(getProductArch("um").toNarrow(), "lx8266");
  EXPECT_THAT(commandLines(trace), ElementsAre(home.path() + "/bin/qinfo -p um"));
  for (const char* text : {"Looking for product code um", "Index of inventory header is 0",
                           "Index of newline after product header is : 15", "Found product line: lx8266 Product (um)",
                           "Architecture for product code [um] is [lx8266]"})
    EXPECT_TRUE(trace.has(RAS1_DETAIL, text)) << text;
}

TEST_F(ProductLookups, PlatformLinesOfAnotherFormDoNotCount) {
  inventory("Platform codes:\nlx8266 product (um)\nlx8266 Product um\nlx8266 Product (um) more\nProduct (um)\n");
  EXPECT_EQ(getProductArch("um").toNarrow(), "");
}

TEST_F(ProductLookups, PlatformListingWithoutItsHeaderFindsNothing) {
  inventory("lx8266 Product (um)\n");
  EXPECT_EQ(getProductArch("um").toNarrow(), "");
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Product header string Platform codes:, not found"));
}

TEST_F(ProductLookups, PlatformHeaderWithoutALineEndFindsNothing) {
  inventory("Platform codes:");
  EXPECT_EQ(getProductArch("um").toNarrow(), "");
  EXPECT_TRUE(trace.has(RAS1_ERROR, "No newline character '\n' found after Product header"));
}

TEST_F(ProductLookups, DirectoryOfAnArchitecture) {
  EXPECT_EQ(getProductArchDir("lx8266", "um").toNarrow(), home.path() + "/zlpqor6/lx8266/um");
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Architecture directory for architecture [lx8266] product code [um] is [" +
                                         home.path() + "/zlpqor6/lx8266/um]"));
  EXPECT_EQ(getProductArchDir("lx8266", "ax").toNarrow(), home.path() + "/zlpqor6/lx8266/bin");
  EXPECT_EQ(getProductArchDir("", "um").toNarrow(), "");
  EXPECT_EQ(getProductArchDir("lx8266", "").toNarrow(), "");
}

}  // namespace
