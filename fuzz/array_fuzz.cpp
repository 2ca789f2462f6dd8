// Operations on an array and on a std::vector, for plain elements and for others.

#include <algorithm>
#include <string>
#include <vector>

#include "fuzz/support.h"
#include "util/array.h"
#include "util/string.h"

using VMQ::Array;
using VMQ::String;

namespace {

constexpr unsigned mostSteps = 30;
constexpr size_t longest = 500;

template <typename T>
T element(unsigned value) {
  if constexpr (std::is_same_v<T, String>) {
    // cppcheck-suppress returnDanglingLifetime ; a String copies it
    return std::to_string(value).c_str();
  } else {
    return static_cast<T>(value);
  }
}

template <typename T>
class Twins {
 public:
  explicit Twins(fuzz::Input& input) : input_(input) {}

  void run() {
    for (unsigned step = 0; step < mostSteps && !input_.empty(); ++step) {
      change();
      capacity_ = std::max(capacity_, static_cast<unsigned>(twin_.size()));
      fuzz::require(array_.getSize() == twin_.size(), "the size is the twin's");
      fuzz::require(array_.getCapacity() == capacity_, "it grows to what is asked");
      fuzz::require(std::equal(twin_.begin(), twin_.end(), array_.getData()), "the elements are the twin's");
      if (twin_.size() > longest) clear();
    }
  }

 private:
  unsigned below(size_t limit) { return input_.below(static_cast<unsigned>(std::max<size_t>(limit, 1))); }
  unsigned anyPosition() {
    const unsigned choice = input_.byte();
    return choice < 252 ? below(twin_.size() + 2) : UINT32_MAX - (choice - 252);
  }
  void clear() {
    array_.clear();
    twin_.clear();
    capacity_ = 8;
  }

  void change() {
    const unsigned at = anyPosition();
    const unsigned first = below(twin_.size());
    const unsigned count = below(twin_.size() - first + 1);
    const std::vector<T> own(twin_.begin() + first, twin_.begin() + first + count);
    std::vector<T> more(below(6));
    for (T& each : more) each = element<T>(input_.byte());
    const auto size = static_cast<unsigned>(more.size());
    switch (below(10)) {
      case 0:
        array_.append(element<T>(at));
        twin_.push_back(element<T>(at));
        break;
      case 1:
        array_.append(more.data(), size);
        twin_.insert(twin_.end(), more.begin(), more.end());
        break;
      case 2:
        array_.append(array_.getData() + first, count);
        twin_.insert(twin_.end(), own.begin(), own.end());
        break;
      case 3:
        if (fuzz::happens(at <= twin_.size(), [&] { array_.insert(at, more.data(), size); }))
          twin_.insert(twin_.begin() + at, more.begin(), more.end());
        break;
      case 4:
        if (fuzz::happens(at <= twin_.size(), [&] { array_.insert(at, array_.getData() + first, count); }))
          twin_.insert(twin_.begin() + at, own.begin(), own.end());
        break;
      case 5:
        array_.prepend(more.data(), size);
        twin_.insert(twin_.begin(), more.begin(), more.end());
        break;
      case 6: {
        const unsigned many = anyPosition();
        if (fuzz::happens(uint64_t{at} + many <= twin_.size(), [&] { array_.remove(at, many); }))
          twin_.erase(twin_.begin() + at, twin_.begin() + at + many);
        break;
      }
      case 7:
        if (fuzz::happens(at < twin_.size(), [&] { array_[at] = element<T>(first); })) twin_[at] = element<T>(first);
        break;
      case 8: {
        Array<T> copy(array_);
        array_ = size % 2 == 0 ? std::move(copy) : Array<T>(copy);
        break;
      }
      default:
        array_.reserveCapacity(first + size);
        capacity_ = std::max(capacity_, first + size);
    }
  }

  fuzz::Input& input_;
  Array<T> array_;
  std::vector<T> twin_;
  unsigned capacity_ = 8;
};

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  fuzz::Input input(data, size);
  switch (input.below(3)) {
    case 0:
      Twins<unsigned short>(input).run();
      break;
    case 1:
      Twins<long>(input).run();
      break;
    default:
      Twins<String>(input).run();
  }
  return 0;
}
