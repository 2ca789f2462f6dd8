// Reads the JSON body of a query as it comes: members keep their order and nothing is built in between.

#include "apps/vmqd/query_body.h"

#include <nlohmann/json.hpp>
#include <string>

#include "apps/vmqd/refusal.h"

namespace vmqd {
namespace {

using Json = nlohmann::json;

class BodyReader {
 public:
  explicit BodyReader(Predicates& predicates) : predicates_(predicates) {}

  // What the parser calls. True: go on. Everything that is wrong leaves as a Refusal.
  bool null() { return misplaced(); }
  bool boolean(bool) { return misplaced(); }
  bool number_float(double, const std::string&) { return misplaced(); }
  bool binary(Json::binary_t&) { return misplaced(); }
  bool number_integer(int64_t number) { return value(std::to_string(number)); }
  bool number_unsigned(uint64_t number) { return value(std::to_string(number)); }
  bool string(const std::string& text) { return value(text); }
  bool start_array(size_t) { return misplaced(); }
  bool end_array() { return true; }
  bool start_object(size_t);
  bool end_object();
  bool key(const std::string& name);
  bool parse_error(size_t position, const std::string&, const Json::exception&) {
    throw Refusal(errors::badJson, "The body is not JSON: it goes wrong at byte " + std::to_string(position) + ".");
  }

 private:
  /// Inside of what the parser is.
  enum Place { kNothing, kBody, kPredicates, kOperator };

  bool value(std::string_view text);
  [[noreturn]] bool misplaced() const;
  [[noreturn]] void refuseColumn() const;

  Predicates& predicates_;
  Place place_ = kNothing;
  bool has_predicates_ = false;
  std::string column_;
  _IntfOper oper_ = INTF_EQ;
  unsigned operators_ = 0;  ///< of this column
};

bool BodyReader::start_object(size_t) {
  if (place_ == kOperator) refuseColumn();
  place_ = static_cast<Place>(place_ + 1);
  operators_ = 0;
  return true;
}

bool BodyReader::end_object() {
  if (place_ == kOperator && operators_ != 1) refuseColumn();
  place_ = static_cast<Place>(place_ - 1);
  return true;
}

bool BodyReader::key(const std::string& name) {
  switch (place_) {
    case kBody:
      if (name != "predicates")
        throw Refusal(errors::badRequest, "The body has an unknown member " + inQuotes(name) + ".");
      if (has_predicates_) throw Refusal(errors::badRequest, "The body has \"predicates\" twice.");
      has_predicates_ = true;
      break;
    case kPredicates:
      column_ = name;
      oper_ = INTF_EQ;
      break;
    default:
      if (++operators_ > 1) refuseColumn();
      oper_ = Predicates::operatorNamed(column_, name);
  }
  return true;
}

bool BodyReader::value(std::string_view text) {
  if (place_ < kPredicates) misplaced();
  predicates_.add(column_, oper_, text);
  return true;
}

bool BodyReader::misplaced() const {
  if (place_ >= kPredicates) refuseColumn();
  throw Refusal(errors::badRequest,
                place_ == kNothing ? "The body is not an object." : "\"predicates\" is not an object.");
}

void BodyReader::refuseColumn() const {
  throw Refusal(errors::badRequest, "The value of " + inQuotes(column_) +
                                        " is not a string, an integer or an object of one operator with one of these.");
}

}  // namespace

void readQueryBody(std::string_view body, Predicates& predicates) {
  BodyReader reader(predicates);
  (void)Json::sax_parse(body.begin(), body.end(), &reader);  // the reader throws where this would be false
}

}  // namespace vmqd
