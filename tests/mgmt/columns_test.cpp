// The tables' columns, as the management server knows them.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <ostream>
#include <string>
#include <vector>

#include "tests/mgmt/running_component.h"

namespace {

using testing::ElementsAre;

struct Column {
  std::string name;
  std::string attribute;
  unsigned type;
  unsigned width;
  unsigned offset;
  bool operator==(const Column&) const = default;
};

std::ostream& operator<<(std::ostream& out, const Column& column) {
  return out << column.name << " " << column.attribute << " " << column.type << " " << column.width << " "
             << column.offset;
}

class Columns : public testing::Test {
 protected:
  std::vector<Column> columnsOf(const std::string& table) {
    open(table);
    std::vector<Column> columns;
    for (unsigned index = 0; index < request().NumColumns(); ++index) {
      ColumnInfo info{};
      EXPECT_EQ(request().GetColumnInfo(&info, static_cast<int>(index)), 0u);
      columns.push_back({nameOf(info), info.attribute, info.type, info.byte_width, info.byte_offset});
    }
    return columns;
  }

  void expectNoColumnOutside(const std::string& table, int count) {
    open(table);
    for (const int index : {-1, count + 1, 1000}) {
      ColumnInfo info{};
      EXPECT_EQ(request().GetColumnInfo(&info, index), 0x21060007u) << index;
    }
    // The count itself is accepted and describes nothing.
    ColumnInfo untouched{"before", 1, 2, 3};
    EXPECT_EQ(request().GetColumnInfo(&untouched, count), 0u);
    EXPECT_STREQ(untouched.attribute, "before");
    EXPECT_EQ(untouched.byte_offset, 1u);
    EXPECT_EQ(untouched.byte_width, 2u);
    EXPECT_EQ(untouched.type, 3u);
  }

  bxira& request() { return opened_->request(); }

 private:
  void open(const std::string& table) {
    runningComponent();
    opened_ = vmqhost::OpenRequest::open(query(table), rows_);
    ASSERT_NE(opened_, nullptr) << table;
  }
  /// The upper-case name by which the column is found in a row: it must be the one place where the row holds a mark.
  std::string nameOf(const ColumnInfo& info) {
    std::string name;
    for (const char* c = info.attribute; *c != '\0'; ++c) name += static_cast<char>(toupper(*c));
    std::string row(5000, ' ');
    const bool integer = info.type == COLUMN_INTEGER;
    const std::string mark = integer ? std::string("\1\0\0\0", 4) : "mark";
    row.replace(info.byte_offset, mark.size(), mark);
    std::string value = integer ? "1" : "mark";
    EXPECT_NE(request().ColumnIsException(name.data(), row.data(), INTF_EQ, value.data()), 0u) << name;
    return name;
  }

  vmqhost::RowBuffer rows_{1};
  std::unique_ptr<vmqhost::OpenRequest> opened_;
};

TEST_F(Columns, OfKagreqt) {
  EXPECT_THAT(columnsOf("KAGREQT"), ElementsAre(Column{"ORIGINNODE", "originnode", 9, 64, 0},      //
                                                Column{"TRANSID", "transid", 9, 84, 64},           //
                                                Column{"COMMAND", "command", 9, 16, 148},          //
                                                Column{"PRODUCT", "product", 9, 32, 164},          //
                                                Column{"CONTEXT", "context", 9, 3072, 196},        //
                                                Column{"OPTIONAL", "optional", 9, 32, 3268},       //
                                                Column{"DACONFIG", "daconfig", 9, 32, 3300},       //
                                                Column{"DASCRIPT", "dascript", 9, 512, 3332},      //
                                                Column{"RETVAL", "retval", 3, 4, 3844},            //
                                                Column{"VERSION", "version", 9, 12, 3848},         //
                                                Column{"RETMSGID", "retmsgid", 9, 16, 3860},       //
                                                Column{"RETMSGPARM", "retmsgparm", 9, 256, 3876},  //
                                                Column{"TARGETMSN", "targetmsn", 9, 64, 4132}));
  expectNoColumnOutside("KAGREQT", 13);
}

TEST_F(Columns, OfKagdyst) {
  EXPECT_THAT(columnsOf("KAGDYST"), ElementsAre(Column{"ORIGINNODE", "originnode", 9, 64, 0},     //
                                                Column{"TRANSID", "transid", 9, 84, 64},          //
                                                Column{"COMMAND", "command", 9, 16, 148},         //
                                                Column{"RETVAL", "retval", 3, 4, 164},            //
                                                Column{"RETMSGID", "retmsgid", 9, 16, 168},       //
                                                Column{"RETMSGPARM", "retmsgparm", 9, 256, 184},  //
                                                Column{"TARGETMSN", "targetmsn", 9, 64, 440}));
  expectNoColumnOutside("KAGDYST", 7);
}

TEST_F(Columns, OfKinagt) {
  EXPECT_THAT(columnsOf("KINAGT"), ElementsAre(Column{"ORIGINNODE", "originnode", 9, 64, 0},    //
                                               Column{"CORVELHOME", "corvelhome", 9, 512, 64},  //
                                               Column{"HOSTTYPE", "hosttype", 9, 5, 576},       //
                                               Column{"HOSTPC", "hostpc", 9, 10, 581},          //
                                               Column{"PRODUCT", "product", 9, 32, 591},        //
                                               Column{"VERSION", "version", 9, 12, 623},        //
                                               Column{"PRODDESC", "proddesc", 9, 80, 635},      //
                                               Column{"RELEASE", "release", 9, 12, 715},        //
                                               Column{"PLATFORM", "platform", 9, 20, 727}));
  expectNoColumnOutside("KINAGT", 9);
}

TEST_F(Columns, UnknownNameMatchesNothing) {
  for (const char* table : {"KAGREQT", "KAGDYST", "KINAGT"}) {
    columnsOf(table);
    std::string row(5000, ' ');
    for (std::string name : {"", "NOSUCH", "originnode"}) {
      std::string value = "mark";
      EXPECT_EQ(request().ColumnIsException(name.data(), row.data(), INTF_NE, value.data()), 0u) << name;
    }
  }
}

}  // namespace
