// The run-as database, read from a file.
#include "util/startup_db.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "test_seam.h"
#include "tests/support/process_resources.h"
#include "tests/support/temporary_directory.h"
#include "util/dom_element.h"
#include "util/startup_elements.h"

namespace fs = std::filesystem;
using VMQ::AgentEntry;
using VMQ::DOMElement;
using VMQ::InstanceEntry;
using VMQ::StartupDB;
using VMQ::String;

namespace {

// One line for each agent: "product: name=user name=user".
std::string modelOf(const StartupDB& database) {
  std::string model;
  for (unsigned i = 0; i < database.getNumAgents(); ++i) {
    const AgentEntry* const agent = database.getAgent(i);
    model += agent->getProductCode().toNarrow() + ":";
    for (unsigned n = 0; n < agent->getNumInstances(); ++n) {
      const InstanceEntry* const instance = agent->getInstance(n);
      model += " " + instance->getInstanceName().toNarrow() + "=" + instance->getUser().toNarrow();
    }
    model += "\n";
  }
  return model;
}

constexpr char twoAgents[] =
    "<runas>\n"
    "\t<agent>\n"
    "\t\t<productCode>um</productCode>\n"
    "\t\t<instance>\n"
    "\t\t\t<name>inst1</name>\n"
    "\t\t\t<user>dbuser</user>\n"
    "\t\t</instance>\n"
    "\t\t<instance>\n"
    "\t\t\t<name>inst2</name>\n"
    "\t\t\t<user></user>\n"
    "\t\t</instance>\n"
    "\t</agent>\n"
    "\t<agent>\n"
    "\t\t<productCode>ux</productCode>\n"
    "\t</agent>\n"
    "</runas>\n";

class StartupDBTest : public testing::Test {
 protected:
  [[nodiscard]] StartupDB load(const std::string& text) const {
    directory_.writeFile("runas.cfg", text);
    return StartupDB(String(path_.c_str()));
  }

  TemporaryDirectory directory_;
  const std::string path_ = directory_ / "runas.cfg";
  TEST_TraceCapture trace_;
};

// ---- loading -------------------------------------------------------------------------------------------------------

TEST_F(StartupDBTest, FileIsLoadedByTheConstructor) {
  const StartupDB database = load(twoAgents);
  EXPECT_EQ(modelOf(database), "um: inst1=dbuser inst2=\nux:\n");
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Parsing file: " + path_));
  EXPECT_THAT(trace_.texts(RAS1_ERROR), testing::IsEmpty());
}

TEST_F(StartupDBTest, UserIsFoundByProductAndInstance) {
  const StartupDB database = load(twoAgents);
  AgentEntry* const agent = database.getAgent(String("um"));
  ASSERT_NE(agent, nullptr);
  ASSERT_NE(agent->getInstance(String("inst1")), nullptr);
  EXPECT_EQ(agent->getInstance(String("inst1"))->getUser(), String("dbuser"));
  EXPECT_EQ(agent->getInstance(String("inst3")), nullptr);
  EXPECT_EQ(database.getAgent(String("lz")), nullptr);
}

struct Case {
  const char* name;
  std::string text;
  std::string model;
};

class StartupDBTextTest : public StartupDBTest, public testing::WithParamInterface<Case> {};

TEST_P(StartupDBTextTest, GivesThisModel) {
  EXPECT_EQ(modelOf(load(GetParam().text)), GetParam().model);
}

INSTANTIATE_TEST_SUITE_P(
    Tolerated, StartupDBTextTest,
    testing::Values(
        Case{"EmptyRoot", "<runas></runas>", ""}, Case{"EmptyRootTag", "<runas/>", ""},
        Case{"BlanksAroundEveryText",
             "<runas><agent><productCode> \tum\n </productCode><instance><name> inst1 </name><user>\n dbuser\t"
             "</user></instance></agent></runas>",
             "um: inst1=dbuser\n"},
        Case{"BlanksInsideAText", "<r><agent><productCode>u m</productCode></agent></r>", "u m:\n"},
        Case{"AnotherRoot", "<anything><agent><productCode>um</productCode></agent></anything>", "um:\n"},
        Case{"UserInFrontOfName",
             "<r><agent><productCode>um</productCode><instance><user>u</user><name>n</name></instance></agent></r>",
             "um: n=u\n"},
        Case{"InstanceInFrontOfProductCode",
             "<r><agent><instance><name>n</name><user>u</user></instance><productCode>um</productCode></agent></r>",
             "um: n=u\n"},
        Case{"UserWithoutName",
             "<r><agent><productCode>um</productCode><instance><user>u</user></instance></agent></r>", "um: =\n"},
        Case{"NameWithoutUser",
             "<r><agent><productCode>um</productCode><instance><name>n</name></instance></agent></r>", "um: n=\n"},
        Case{"EmptyInstance", "<r><agent><productCode>um</productCode><instance/></agent></r>", "um: =\n"},
        Case{"EmptyName",
             "<r><agent><productCode>um</productCode><instance><name/><user>u</user></instance></agent></r>",
             "um: =u\n"},
        Case{"EmptyProductCode", "<r><agent><productCode/></agent></r>", ":\n"},
        Case{"RepeatedAgents",
             "<r><agent><productCode>um</productCode></agent>"
             "<agent><productCode>um</productCode><instance/></agent></r>",
             "um:\num: =\n"},
        Case{"RepeatedElements",
             "<r><agent><productCode>1</productCode><productCode>2</productCode>"
             "<instance><name>3</name><name>4</name><user>5</user><user>6</user></instance></agent></r>",
             "1: 3=5\n"},
        Case{"UnknownElements",
             "<r><x><agent><productCode>no</productCode></agent></x>"
             "<agent><note>!</note><productCode>um</productCode>"
             "<instance><name>n</name><group>g</group><user>u</user></instance></agent></r>",
             "um: n=u\n"},
        Case{"ElementsAtOtherDepths",
             "<r><productCode>no</productCode><instance/><agent><x><productCode>no</productCode></x></agent>"
             "<agent><productCode>um</productCode><x><instance/></x></agent></r>",
             "um:\n"},
        Case{"NamesInAnotherCase",
             "<r><Agent><productCode>no</productCode></Agent>"
             "<agent><productCode>um</productCode><INSTANCE/></agent></r>",
             "um:\n"},
        Case{"RootNamedAgent", "<agent><productCode>um</productCode></agent>", ""},
        Case{"AttributesAndComments",
             "<?xml version='1.0'?><!-- c --><r a='1'><agent b='2'><!-- c --><productCode>um</productCode></agent></r>",
             "um:\n"},
        Case{"EscapedCharacters", "<r><agent><productCode>&lt;&amp;</productCode></agent></r>", "<&:\n"},
        Case{"TextInFrontOfAChildIsPartOfItsText", "<r><agent>x<productCode>um</productCode></agent></r>", "xum:\n"}),
    [](const auto& test) { return std::string(test.param.name); });

TEST_F(StartupDBTest, AgentWithoutProductCodeIsDroppedAndTheOthersStay) {
  const StartupDB database = load(
      "<r><agent><productCode>a</productCode></agent><agent><instance/></agent>"
      "<agent><productCode>b</productCode></agent></r>");
  EXPECT_EQ(modelOf(database), "a:\nb:\n");
  EXPECT_THAT(trace_.texts(RAS1_ERROR), testing::ElementsAre("Agent element missing <productCode> element"));
}

TEST_F(StartupDBTest, LookupIsExactAndFindsTheFirst) {
  const StartupDB database = load(
      "<r><agent><productCode>um</productCode><instance><user>u</user></instance></agent>"
      "<agent><productCode>um</productCode></agent></r>");
  EXPECT_EQ(database.getNumAgents(), 2u);
  EXPECT_EQ(database.getAgent(String("um")), database.getAgent(0U));
  EXPECT_EQ(database.getAgent(String("UM")), nullptr);
  // The user of an instance without a name is not read, and its empty name finds it.
  ASSERT_NE(database.getAgent(0U)->getInstance(String("")), nullptr);
  EXPECT_EQ(database.getAgent(0U)->getInstance(String(""))->getUser(), String(""));
}

TEST_F(StartupDBTest, EditedFileIsNotReadAgain) {
  const StartupDB database = load(twoAgents);
  directory_.writeFile("runas.cfg", "<runas/>");
  EXPECT_EQ(database.getNumAgents(), 2u);
}

// ---- files that cannot be used -------------------------------------------------------------------------------------

TEST_F(StartupDBTest, MissingFileGivesAnEmptyDatabase) {
  const StartupDB database{String(path_.c_str())};
  EXPECT_EQ(database.getNumAgents(), 0u);
  EXPECT_EQ(database.getAgent(0U), nullptr);
  EXPECT_EQ(database.getAgent(String("um")), nullptr);
  EXPECT_THAT(trace_.texts(RAS1_ERROR), testing::ElementsAre("Error reading file (defaults will be used): " + path_ +
                                                             ". Error: No such file or directory"));
}

TEST_F(StartupDBTest, DirectoryGivesAnEmptyDatabase) {
  fs::create_directory(path_);
  const StartupDB database{String(path_.c_str())};
  EXPECT_EQ(database.getNumAgents(), 0u);
  EXPECT_TRUE(
      trace_.has(RAS1_ERROR, "Error reading file (defaults will be used): " + path_ + ". Error: Is a directory"));
}

TEST_F(StartupDBTest, EmptyFileGivesAnEmptyDatabase) {
  EXPECT_EQ(load("").getNumAgents(), 0u);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error reading file (defaults will be used): " + path_ + ". Error: Success"));
}

TEST_F(StartupDBTest, OneSyntaxErrorDiscardsTheWholeFile) {
  const StartupDB database = load(
      "<runas>\n<agent><productCode>um</productCode></agent>\n<agent><productCode>R&D</productCode></agent></runas>");
  EXPECT_EQ(database.getNumAgents(), 0u);
  EXPECT_THAT(trace_.texts(RAS1_ERROR),
              testing::ElementsAre("Error parsing xml defaults will be used: 3:23: not well-formed (invalid token)\n"));
}

TEST_F(StartupDBTest, ParseFailureWithoutAMessageIsTracedToo) {
  const TEST_FailCall failing("XML1_ParserCreate", 1, 0);
  EXPECT_EQ(load(twoAgents).getNumAgents(), 0u);
  EXPECT_TRUE(trace_.hasPrefix(RAS1_ERROR, "Error parsing xml defaults will be used: "));
}

TEST_F(StartupDBTest, FileCutAnywhereGivesAnEmptyOrTheWholeModel) {
  const std::string whole = twoAgents;
  const size_t end_of_root = whole.size() - 1;  // only the last line feed may be missing
  for (size_t length = 0; length <= whole.size(); ++length) {
    EXPECT_EQ(load(whole.substr(0, length)).getNumAgents(), length < end_of_root ? 0u : 2u) << length;
  }
}

TEST_F(StartupDBTest, NothingIsLeftOpen) {
  const ProcessResources before = ProcessResources::now();
  (void)load(twoAgents);
  (void)load("<runas>");
  EXPECT_EQ(ProcessResources::now(), before);
}

// ---- changing ------------------------------------------------------------------------------------------------------

TEST_F(StartupDBTest, RemovedAgentClosesItsGap) {
  StartupDB database = load(twoAgents);
  AgentEntry* const second = database.getAgent(1U);
  database.removeAgent(0);
  EXPECT_EQ(database.getNumAgents(), 1u);
  EXPECT_EQ(database.getAgent(0U), second);
  EXPECT_EQ(database.getAgent(String("um")), nullptr);
}

TEST_F(StartupDBTest, RemovalBeyondTheCountDoesNothing) {
  StartupDB database = load(twoAgents);
  database.removeAgent(2);
  database.removeAgent(0xFFFFFFFF);
  EXPECT_EQ(database.getNumAgents(), 2u);
  EXPECT_EQ(database.getAgent(2U), nullptr);
}

TEST_F(StartupDBTest, AddedAgentIsTheLast) {
  StartupDB database = load(twoAgents);
  auto* const agent = new AgentEntry(String("um"));
  database.addAgent(agent);
  EXPECT_EQ(database.getNumAgents(), 3u);
  EXPECT_EQ(database.getAgent(2U), agent);
  EXPECT_NE(database.getAgent(String("um")), agent);
}

TEST_F(StartupDBTest, CopyIsDeep) {
  auto original = std::make_unique<StartupDB>(load(twoAgents));
  const StartupDB copy(*original);
  EXPECT_NE(copy.getAgent(0U), original->getAgent(0U));
  EXPECT_NE(copy.getAgent(0U)->getInstance(0U), original->getAgent(0U)->getInstance(0U));
  original.reset();
  EXPECT_EQ(modelOf(copy), "um: inst1=dbuser inst2=\nux:\n");
}

// ---- the loader's own functions ------------------------------------------------------------------------------------

TEST(StartupElementsTest, FirstChildOfTheNameIsFound) {
  DOMElement parent("parent");
  auto* const first = new DOMElement("a");
  parent.addChild(new DOMElement("b"));
  parent.addChild(first);
  parent.addChild(new DOMElement("a"));
  EXPECT_EQ(VMQ::getChildElement(&parent, "a"), first);
  EXPECT_EQ(VMQ::getChildElement(&parent, "c"), nullptr);
  EXPECT_EQ(VMQ::getChildElement(nullptr, "a"), nullptr);
}

TEST(StartupElementsTest, ElementWithoutTextGivesAnEmptyValue) {
  DOMElement agent("agent");
  agent.addChild(new DOMElement("productCode"));
  const std::unique_ptr<AgentEntry> entry(VMQ::buildAgentEntry(&agent));
  ASSERT_NE(entry, nullptr);
  EXPECT_EQ(entry->getProductCode(), String(""));
}

TEST_F(StartupDBTest, ModelOfNoElementIsEmpty) {
  StartupDB database = load("<runas/>");
  database.buildModel(nullptr);
  EXPECT_EQ(database.getNumAgents(), 0u);
}

}  // namespace
