// Operations on a text and on its plain model, also those that have to throw and to leave it as it was.

#include <algorithm>
#include <string>

#include "fuzz/support.h"
#include "tests/util/text_model.h"
#include "util/string.h"

using namespace text_model;
using VMQ::String;

namespace {

constexpr unsigned mostSteps = 30;
constexpr unsigned longest = 2000;

class Twins {
 public:
  explicit Twins(fuzz::Input& input) : input_(input) {}

  void run() {
    for (unsigned step = 0; step < mostSteps && !input_.empty(); ++step) {
      change();
      look();
      if (model_.size() > longest) clear();
    }
  }

 private:
  unsigned below(size_t limit) { return input_.below(static_cast<unsigned>(std::max<size_t>(limit, 1))); }
  Model piece() {
    Model result;
    for (unsigned count = below(8); count > 0; --count) result += u"aab\\\\ ,\t\u00E9\u20AC\xD83D\xFFFF"[below(12)];
    return result;
  }
  void clear() {
    text_.clear();
    model_.clear();
  }
  /// Mostly near the length, sometimes so far that sums would wrap.
  unsigned anyPosition() {
    const unsigned choice = input_.byte();
    return choice < 250 ? below(model_.size() + 3) : String::NPOS - (choice - 250);
  }
  [[nodiscard]] bool inRange(unsigned position, unsigned count) const {
    return count >= 1 && uint64_t{position} + count <= model_.size();
  }

  void change() {
    const Model other = piece();
    const unsigned at = anyPosition();
    const unsigned count = anyPosition();
    switch (below(13)) {
      case 0:
        text_.append(static_cast<unsigned short>(u'x'));
        model_ += u'x';
        break;
      case 1:
        text_.append(textOf(other));
        model_ += other;
        break;
      case 2:
        if (fuzz::happens(count <= model_.size(), [&] { text_.append(text_, count); }))
          model_ += model_.substr(0, count);
        break;
      case 3:
        if (fuzz::happens(inRange(at, count), [&] { text_.erase(at, count); })) model_.erase(at, count);
        break;
      case 4:
        if (fuzz::happens(at < model_.size(), [&] { text_.erase(at); })) model_.erase(at);
        break;
      case 5:
        text_.trim();
        model_ = trim(model_);
        break;
      case 6:
        text_.insertEscapes(ESC, textOf(other));
        model_ = insertEscapes(model_, other);
        break;
      case 7:
        text_.removeEscapes(ESC);
        model_ = removeEscapes(model_);
        break;
      case 8: {
        const Model from = piece();
        text_ = String::replace(text_, textOf(from), textOf(other));
        model_ = replace(model_, from, other);
        break;
      }
      case 9:
        text_.assign(text_, count);
        model_.resize(std::min<size_t>(count, model_.size()));
        break;
      case 10:
        text_ = textOf(other);
        model_ = other;
        break;
      case 11: {
        String moved(std::move(text_));
        text_ = moved + textOf(other);
        model_ += other;
        break;
      }
      default:
        if (inRange(at, count)) {
          text_.assign(text_.getData() + at, count);
          model_ = model_.substr(at, count);
        }
    }
  }

  void look() {
    fuzz::require(text_ == textOf(model_) && text_.length() == model_.size(), "the text is that of the model");
    fuzz::require(text_.getData()[text_.length()] == 0, "a zero ends it");
    const Model other = piece();
    const unsigned at = anyPosition();
    const unsigned count = anyPosition();
    const auto comma = static_cast<unsigned short>(u',');
    fuzz::require(text_.find(textOf(other), at) == (other.empty() ? String::NPOS : position(model_.find(other, at))),
                  "a text is found where it is");
    const size_t last = model_.rfind(u'a');
    fuzz::require(text_.rfind('a') == (last == 0 ? String::NPOS : position(last)), "so is the last of a unit");
    const int sign = String::compare(text_, textOf(other));
    const int expected = model_.compare(other);
    fuzz::require((sign < 0) == (expected < 0) && (sign > 0) == (expected > 0), "texts are in order");
    unsigned found = 0;
    if (fuzz::happens(at < model_.size(), [&] { found = text_.find(comma, at); })) {
      fuzz::require(found == position(model_.find(u',', at)), "a unit is found where it is");
    }
    if (fuzz::happens(at < model_.size(), [&] { found = text_.find(comma, ESC, at); })) {
      fuzz::require(found == position(findUnescaped(model_, u',', at)), "so is one that is not escaped");
    }
    String slice;
    if (fuzz::happens(inRange(at, count), [&] { slice = text_.substr(at, count); })) {
      fuzz::require(slice == textOf(model_.substr(at, count)), "a piece is what stands there");
    }
    if (fuzz::happens(at <= model_.size(), [&] { found = text_[at]; })) {
      fuzz::require(found == (at < model_.size() ? model_[at] : 0), "and so is a unit");
    }
  }

  fuzz::Input& input_;
  String text_;
  Model model_;
};

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  fuzz::Input input(data, size);
  Twins(input).run();
  return 0;
}
