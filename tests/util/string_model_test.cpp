// Random operations on a text and on a plain std::u16string.
#include <gtest/gtest.h>

#include <random>
#include <string>

#include "tests/util/text_model.h"
#include "util/string.h"

using VMQ::String;

namespace {

using namespace text_model;

class StringModel : public testing::Test {
 protected:
  void run(unsigned int seed, int steps) {
    SCOPED_TRACE("seed " + std::to_string(seed));
    random_.seed(seed);
    for (int i = 0; i < steps && !HasFatalFailure(); ++i) {
      SCOPED_TRACE("step " + std::to_string(i));
      change();
      look();
    }
  }

 private:
  unsigned int below(size_t n) { return static_cast<unsigned int>(random_() % std::max<size_t>(n, 1)); }
  Model piece(size_t longest) {
    Model result;
    for (unsigned int n = below(longest + 1); n > 0; --n) result += u"aab\\\\ ,\t\u00E9\u20AC\xD83D"[below(11)];
    return result;
  }

  void change() {
    const unsigned int at = below(model_.size());
    const unsigned int count = below(model_.size() - at + 1);
    const Model other = piece(12);
    switch (below(16)) {
      case 0:
      case 1:
      case 2:
        text_.append(static_cast<unsigned short>(u'x'));
        model_ += u'x';
        break;
      case 3:
      case 4:
        text_.append(textOf(other));
        model_ += other;
        break;
      case 5:
        text_.append(text_, count);
        model_ += model_.substr(0, count);
        break;
      case 6:
        if (count > 0) {
          text_.erase(at, count);
          model_.erase(at, count);
        }
        break;
      case 7:
        text_.trim();
        model_ = trim(model_);
        break;
      case 8:
        text_.insertEscapes(ESC, textOf(other));
        model_ = insertEscapes(model_, other);
        break;
      case 9:
        text_.removeEscapes(ESC);
        model_ = removeEscapes(model_);
        break;
      case 10: {
        const Model from = piece(2);
        text_ = String::replace(text_, textOf(from), textOf(other));
        model_ = replace(model_, from, other);
        break;
      }
      case 11:
        text_.assign(text_.getData() + at, count);
        model_ = model_.substr(at, count);
        break;
      case 12:
        text_.assign(textOf(other));
        model_ = other;
        break;
      case 13: {
        String moved(std::move(text_));
        ASSERT_EQ(text_.length(), 0u);  // NOLINT(bugprone-use-after-move): what it is now is what is tested
        text_ = below(2) ? String(moved) : std::move(moved);
        break;
      }
      case 14:
        text_ = text_ + textOf(other);
        model_ += other;
        break;
      default:
        if (model_.size() > 300 || below(30) == 0) {
          text_.clear();
          model_.clear();
        }
    }
  }

  void look() {
    ASSERT_EQ(text_.length(), model_.size());
    ASSERT_EQ(text_.getData()[text_.length()], 0);
    ASSERT_TRUE(std::equal(model_.begin(), model_.end(), text_.getData()));
    const Model other = piece(3);
    const unsigned int start = below(model_.size() + 2);
    ASSERT_EQ(text_.find(textOf(other), start), other.empty() ? String::NPOS : position(model_.find(other, start)));
    const size_t last = model_.rfind(u'a');
    ASSERT_EQ(text_.rfind('a'), last == 0 ? String::NPOS : position(last));
    const int sign = String::compare(text_, textOf(other));
    const int expected = model_.compare(other);
    ASSERT_EQ(sign < 0, expected < 0);
    ASSERT_EQ(sign > 0, expected > 0);
    ASSERT_EQ(text_ == textOf(other), expected == 0);
    if (start >= model_.size()) return;
    const unsigned int count = 1 + below(model_.size() - start);
    ASSERT_EQ(text_.find(static_cast<unsigned short>(u','), start), position(model_.find(u',', start)));
    ASSERT_EQ(text_.find(static_cast<unsigned short>(u','), ESC, start), position(findUnescaped(model_, u',', start)));
    ASSERT_TRUE(text_.substr(start, count) == textOf(model_.substr(start, count)));
  }

  std::mt19937 random_;
  String text_;
  Model model_;
};

TEST_F(StringModel, AgreesWithAPlainText) {
  for (unsigned int seed = 1; seed <= 10; ++seed) run(seed, 1000);
  run(std::random_device()(), 3000);
}

}  // namespace
