#include "util/resource_bundle.h"

#include <cstdlib>
#include <cstring>
#include <memory>

#include "util/trace.h"
#include "util/util.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/resource_bundle"};

String trimmed(const char* text, unsigned long length) {
  String result(text, static_cast<unsigned>(length));
  result.trim();
  return result;
}

}  // namespace

void freeValueFunc(void* value) {
  const Trace trace(traceUnit);
  delete static_cast<String*>(value);
}

ResourceBundle::ResourceBundle(const String& fileName, char commentCharacter) : comment_character_(commentCharacter) {
  const Trace trace(traceUnit);
  entries_.setAutoDeleteValues(true);
  entries_.setFreeValueFunc(reinterpret_cast<void*>(freeValueFunc));
  char* contents = nullptr;
  unsigned long length = 0;
  if (Util::readFile(fileName.toNarrow().c_str(), &contents, &length) != 0) {
    throw ResourceBundleException(String("Unable to read file: ") + fileName);
  }
  const std::unique_ptr<char, decltype(&std::free)> owned(contents, std::free);
  if (contents != nullptr) parse(contents, length);
}

ResourceBundle::ResourceBundle(const ResourceBundle& other) : comment_character_(other.comment_character_) {
  const Trace trace(traceUnit);
  entries_.setAutoDeleteValues(true);
  entries_.setFreeValueFunc(reinterpret_cast<void*>(freeValueFunc));
  const Array<String> keys = other.getKeys();
  for (unsigned i = 0; i < keys.getSize(); ++i) entries_.put(keys[i], new String(*other.getValue(keys[i])));
}

ResourceBundle::~ResourceBundle() = default;

const String* ResourceBundle::getValue(const String& key) const {
  const Trace trace(traceUnit);
  void* value = nullptr;
  return entries_.get(key, &value) ? static_cast<const String*>(value) : nullptr;
}

Array<String> ResourceBundle::getKeys() const {
  const Trace trace(traceUnit);
  return entries_.getKeys();
}

void ResourceBundle::parse(const char* text, unsigned long length) {
  const Trace trace(traceUnit);
  const char* const end = text + length;
  const char* line = text;
  while (line < end) {
    const auto* const feed = static_cast<const char*>(std::memchr(line, '\n', static_cast<size_t>(end - line)));
    const char* line_end = feed == nullptr ? end : feed;
    // A carriage return belongs to the line end only in front of a line feed.
    if (feed != nullptr && feed > line && feed[-1] == '\r') --line_end;
    parseLine(line, static_cast<unsigned long>(line_end - line));
    if (feed == nullptr) return;
    line = feed + 1;
  }
}

void ResourceBundle::parseLine(const char* line, unsigned long length) {
  const Trace trace(traceUnit);
  if (length == 0 || *line == comment_character_) return;
  const auto* const equals = static_cast<const char*>(std::memchr(line, '=', length));
  if (equals == nullptr) return;
  const auto key_length = static_cast<unsigned long>(equals - line);
  entries_.put(trimmed(line, key_length), new String(trimmed(equals + 1, length - key_length - 1)));
}

}  // namespace VMQ
