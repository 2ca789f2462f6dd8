#pragma once
// Text files of "key=value" lines.

#include "util/array.h"
#include "util/str_ptr_map.h"
#include "util/string.h"

namespace VMQ {

/// Why a ResourceBundle could not be made.
class ResourceBundleException {
 public:
  explicit ResourceBundleException(const String& message) : message_(message) {}
  ResourceBundleException(const ResourceBundleException& other) = default;
  ResourceBundleException& operator=(const ResourceBundleException&) = delete;
  virtual ~ResourceBundleException() = default;

  [[nodiscard]] String getErrorMessage() const { return message_; }

 private:
  const String message_;
};

/// The entries of one file, read once, in the process's code page. Belongs to one thread at a time.
/// Lines end with a line feed, or a carriage return and a line feed. Key and value are the texts before and behind a
/// line's first "=", without the white space around them. Lines without "=" say nothing; neither do those whose very
/// first character is the comment character (kept on purpose: one blank in front of it, and the line counts). Of a
/// repeated key the last value counts; the key may be empty.
class ResourceBundle {
 public:
  /// Throws ResourceBundleException, "Unable to read file: " and the name, when the file cannot be read.
  ResourceBundle(const String& fileName, char commentCharacter);
  /// An independent copy.
  ResourceBundle(const ResourceBundle& other);
  ResourceBundle& operator=(const ResourceBundle&) = delete;
  virtual ~ResourceBundle();

  /// The value of exactly this key, which belongs to the bundle; null when there is none.
  [[nodiscard]] const String* getValue(const String& key) const;
  /// Every key, in the map's order.
  [[nodiscard]] Array<String> getKeys() const;

 private:
  void parse(const char* text, unsigned long length);
  void parseLine(const char* line, unsigned long length);

  StrPtrMap entries_;  // key to a String, which it owns
  const char comment_character_;
};

/// Deletes a String, for a map of them; null is ignored.
void freeValueFunc(void* value);

}  // namespace VMQ
