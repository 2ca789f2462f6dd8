// What the tables have in common, shown by the status table and by tables of the test's own.

#include "mgmt/table_binding.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>
#include <future>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "mgmt/kagdyst.h"
#include "mgmt/kagreqt.h"
#include "mgmt/kinagt.h"
#include "test_seam.h"
#include "tests/mgmt/running_component.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using vmqhost::OpenRequest;

/// Keeps what arrives and answers with a status of the test's choice.
class Listener : public RowRequester {
 public:
  explicit Listener(unsigned status = 0) : status_(status) {}
  unsigned rowsArrived(const char* rows, unsigned row_bytes, unsigned count) override {
    for (unsigned row = 0; row < count; ++row) {
      vmq_kagdyst_data_t status;
      EXPECT_EQ(row_bytes, sizeof status);
      std::memcpy(&status, rows + row * row_bytes, sizeof status);
      retvals.push_back(status.retval);
    }
    return status_;
  }
  std::vector<int> retvals;

 private:
  const unsigned status_;
};

std::unique_ptr<OpenRequest> listen(Listener& listener, const std::vector<RequestDetail::Predicate>& predicates = {}) {
  return OpenRequest::open(query("KAGDYST", predicates), listener);
}

vmq_kagdyst_data_t statusRow(int retval) {
  vmq_kagdyst_data_t row{};
  row.retval = retval;
  return row;
}

class Events : public testing::Test {
 protected:
  Events() { runningComponent(); }
  unsigned send() { return vmq_kagdyst_manager::EventArrived(rows, 3); }
  vmq_kagdyst_data_t rows[3] = {statusRow(0), statusRow(1), statusRow(2)};
};

TEST_F(Events, WithNobodyListeningAreDropped) {
  EXPECT_EQ(send(), 0u);
}

TEST_F(Events, ReachEveryOpenRequest) {
  Listener first, second;
  const auto a = listen(first), b = listen(second);
  EXPECT_EQ(send(), 0u);
  EXPECT_THAT(first.retvals, ElementsAre(0, 1, 2));
  EXPECT_THAT(second.retvals, ElementsAre(0, 1, 2));
}

TEST_F(Events, ReachOnlyTheRequestsWhosePredicatesTheyPass) {
  Listener first, second;
  const auto a = listen(first, {{"RETVAL", INTF_NE, "1"}}), b = listen(second, {{"RETVAL", INTF_GT, "5"}});
  TEST_TraceCapture trace;
  EXPECT_EQ(send(), 0u);
  EXPECT_THAT(first.retvals, ElementsAre(0, 2));
  EXPECT_THAT(second.retvals, IsEmpty());
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Passing row 0 to InsertRow()."));
  EXPECT_FALSE(trace.has(RAS1_DETAIL, "Passing row 1 to InsertRow()."));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Passing row 2 to InsertRow()."));
}

TEST_F(Events, RowsAfterAFailedInsertionAreNotOfferedToThatRequest) {
  Listener first, second;
  const auto a = listen(first), b = listen(second);
  const TEST_FailCall failing("InsertRow", 2, ENOMEM);
  EXPECT_EQ(send(), 0u);  // only the dispatches count
  EXPECT_THAT(first.retvals, ElementsAre(0));
  EXPECT_THAT(second.retvals, ElementsAre(0, 1, 2));
}

TEST_F(Events, AnswerIsTheLastDispatchThatFailed) {
  Listener fine, five(5), six(6);
  {
    const auto a = listen(five), b = listen(fine);
    EXPECT_EQ(send(), 5u);
  }
  {
    const auto a = listen(five), b = listen(six), c = listen(fine);
    EXPECT_EQ(send(), 6u);
  }
}

TEST_F(Events, FailedDispatchLeavesNoRowBehind) {
  Listener listener;
  const auto request = listen(listener);
  {
    const TEST_FailCall failing("Dispatch", 1, 7);
    EXPECT_EQ(send(), 7u);
  }
  EXPECT_EQ(request->request().row_count, 0u);
  EXPECT_EQ(send(), 0u);
  EXPECT_THAT(listener.retvals, ElementsAre(0, 1, 2));
}

TEST_F(Events, GiveTheirHandlesBack) {
  Listener listener;
  const auto request = listen(listener);
  send();
  EXPECT_EQ(bxira::CurrentHandle(), 0u);
}

TEST_F(Events, WithoutTheTablesLockAreLost) {
  Listener listener;
  const auto request = listen(listener);
  TEST_TraceCapture trace;
  const TEST_FailCall failing("BSS1_GetLock", 1, EINVAL);
  EXPECT_EQ(send(), 22u);
  EXPECT_THAT(trace.texts(RAS1_ERROR),
              ElementsAre("Event of table KAGDYST is lost, its lock could not be taken, return code 22"));
  EXPECT_THAT(listener.retvals, IsEmpty());
}

// ---- a request object that throws ----------------------------------------------------------------------------------

class ThrowingManager;
ThrowingManager* throwing_static_manager = nullptr;

struct ThrowingAgent : VMQ::TableRequest<vmq_kagdyst_description> {
  using TableRequest::TableRequest;
  void TakeSampleConstructor() {
    if (detail().sample_type == 1) throw std::runtime_error("not made");
  }
  void TakeSample() override {}
  unsigned AddData(Row*, int) override { throw std::runtime_error("not added"); }
};

class ThrowingManager : public VMQ::TableBinding<ThrowingAgent, ThrowingManager, throwing_static_manager> {
 public:
  using TableBinding::TableBinding;
};

class RequestThatThrows : public testing::Test {
 protected:
  RequestThatThrows() { throwing_static_manager = &manager; }
  ~RequestThatThrows() override { throwing_static_manager = nullptr; }
  ThrowingManager manager{"VMQ", "THROWING"};
  RequestDetail detail;
  ContextInfo context;
  TEST_TraceCapture trace;
};

TEST_F(RequestThatThrows, IsNotMade) {
  detail.sample_type = 1;
  EXPECT_EQ(manager.CreateBxira(&detail, &context), nullptr);
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Exception while creating a request: not made"));
}

TEST_F(RequestThatThrows, LeavesTheTablesLockFree) {
  const std::unique_ptr<bxira> request(manager.CreateBxira(&detail, &context));
  ASSERT_NE(request, nullptr);
  manager.requests.append(request.get());
  vmq_kagdyst_data_t row = statusRow(0);
  EXPECT_EQ(ThrowingManager::EventArrived(&row, 1), static_cast<unsigned>(ENOMEM));
  manager.requests.remove(request.get());
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Exception while delivering an event: not added"));
  EXPECT_EQ(bxira::CurrentHandle(), 0u);
  auto other = std::async(std::launch::async, [this] {
    const int status = BSS1_GetLock(manager.lock());
    return status == 0 ? BSS1_ReleaseLock(manager.lock()) : status;
  });
  EXPECT_EQ(other.get(), 0);
}

class UnmakeableManager : public TableManager {
 public:
  UnmakeableManager(const char* application, const char* table) : TableManager(application, table) {
    throw std::runtime_error("not made");
  }
  bxira* CreateBxira(RequestDetail*, ContextInfo*) override { return nullptr; }
};

TEST(Registration, LetsAnExceptionOfTheManagerThrough) {
  UnmakeableManager* manager = nullptr;
  EXPECT_THROW(VMQ::registerTable(manager, "VMQ", "UNMAKEABLE"), std::runtime_error);
  EXPECT_EQ(manager, nullptr);
  EXPECT_EQ(vmqhost::findTable("VMQ", "UNMAKEABLE"), nullptr);
}

// ---- PrintSelf -----------------------------------------------------------------------------------------------------

std::vector<std::string> printed(bxira& request) {
  TEST_TraceCapture trace;
  request.PrintSelf();
  return trace.texts(RAS1_DETAIL);
}

std::string header(const char* requestClass, bxira& request) {
  char text[200];
  snprintf(text, sizeof text, "%s @%p <%u,%u>\n", requestClass, static_cast<void*>(&request), request.handle(),
           request.manager()->handle());
  return text;
}

std::string counts(const bxira& request, unsigned count) {
  return "\t\tcount=" + std::to_string(count) + ", allocated=" + std::to_string(request.allocatedRows()) +
         ", allocSize=" + std::to_string(request.allocatedBytes()) + "\n";
}

class PrintedRequest : public testing::Test {
 protected:
  PrintedRequest() { runningComponent(); }
  std::unique_ptr<OpenRequest> open(const char* table) {
    RequestDetail detail = query(table);
    detail.interval_seconds = 30;
    detail.sample_type = 2;
    return OpenRequest::open(detail, rows);
  }
  vmqhost::RowBuffer rows{1};
};

template <size_t size>
void put(char (&column)[size], const char* text) {
  std::memset(column, ' ', size);
  std::memcpy(column, text, std::strlen(text));
}

std::string padded(const std::string& attribute, const std::string& text, size_t width) {
  return "\t\t" + attribute + "=\"" + text + std::string(width - text.size(), ' ') + "\"\n";
}

TEST_F(PrintedRequest, WithoutRows) {
  const auto opened = open("KAGDYST");
  bxira& request = opened->request();
  EXPECT_THAT(printed(request),
              ElementsAre(header("vmq_kagdyst_base", request), "\t::appl=VMQ,table=KAGDYST,interval=30,samptype=2\n",
                          "\t_data {\n", "\t\tcount=0, allocated=0, allocSize=0\n", "}\n"));
}

TEST_F(PrintedRequest, OfKagdyst) {
  const auto opened = open("KAGDYST");
  bxira& request = opened->request();
  vmq_kagdyst_data_t row{};
  put(row.originnode, "node7");
  put(row.transid, "t1");
  put(row.command, "START");
  row.retval = 1024;
  put(row.retmsgid, "VMQ1024E");
  put(row.retmsgparm, "some command");
  put(row.targetmsn, "inst1");
  ASSERT_EQ(request.InsertRow(reinterpret_cast<char*>(&row)), 0u);
  row.retval = -1;
  ASSERT_EQ(request.InsertRow(reinterpret_cast<char*>(&row)), 0u);
  const std::vector<std::string> lines = printed(request);
  std::vector<std::string> expected = {header("vmq_kagdyst_base", request),
                                       "\t::appl=VMQ,table=KAGDYST,interval=30,samptype=2\n", "\t_data {\n",
                                       counts(request, 2)};
  for (const char* retval : {"1024", "-1"}) {
    expected.insert(expected.end(), {"\t\t{\n", padded("originnode", "node7", 64), padded("transid", "t1", 84),
                                     padded("command", "START", 16), std::string("\t\tretval=") + retval + "\n",
                                     padded("retmsgid", "VMQ1024E", 16), padded("retmsgparm", "some command", 256),
                                     padded("targetmsn", "inst1", 64), "\t\t}\n"});
  }
  expected.push_back("}\n");
  EXPECT_EQ(lines, expected);
}

TEST_F(PrintedRequest, OfKagreqt) {
  const auto opened = open("KAGREQT");
  bxira& request = opened->request();
  vmq_kagreqt_data_t row;
  std::memset(&row, 'x', sizeof row);  // nothing in a row is terminated
  row.retval = 7;
  ASSERT_EQ(request.InsertRow(reinterpret_cast<char*>(&row)), 0u);
  const auto full = [](const char* attribute, size_t width) {
    return std::string("\t\t") + attribute + "=\"" + std::string(width, 'x') + "\"\n";
  };
  EXPECT_THAT(printed(request),
              ElementsAre(header("vmq_kagreqt_base", request), "\t::appl=VMQ,table=KAGREQT,interval=30,samptype=2\n",
                          "\t_data {\n", counts(request, 1), "\t\t{\n", full("originnode", 64), full("transid", 84),
                          full("command", 16), full("product", 32), full("context", 3072), full("optional", 32),
                          full("daconfig", 32), full("dascript", 512), "\t\tretval=7\n", full("version", 12),
                          full("retmsgid", 16), full("retmsgparm", 256), full("targetmsn", 64), "\t\t}\n", "}\n"));
}

TEST_F(PrintedRequest, OfKinagt) {
  const auto opened = open("KINAGT");
  bxira& request = opened->request();
  vmq_kinagt_data_t row;
  std::memset(&row, 'x', sizeof row);
  ASSERT_EQ(request.InsertRow(reinterpret_cast<char*>(&row)), 0u);
  const auto full = [](const char* attribute, size_t width) {
    return std::string("\t\t") + attribute + "=\"" + std::string(width, 'x') + "\"\n";
  };
  EXPECT_THAT(printed(request),
              ElementsAre(header("vmq_kinagt_base", request), "\t::appl=VMQ,table=KINAGT,interval=30,samptype=2\n",
                          "\t_data {\n", counts(request, 1), "\t\t{\n", full("originnode", 64), full("corvelhome", 512),
                          full("hosttype", 5), full("hostpc", 10), full("product", 32), full("version", 12),
                          full("proddesc", 80), full("release", 12), full("platform", 20), "\t\t}\n", "}\n"));
}

}  // namespace
