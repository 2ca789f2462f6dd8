#pragma once
// What the operations of VMQ::String do, on a plain std::u16string. What that cannot do is written out here step by
// step, without a thought for speed.

#include <string>

#include "util/string.h"

namespace text_model {

using Model = std::u16string;

inline constexpr char16_t ESC = u'\\';

inline Model insertEscapes(Model text, const Model& chars) {
  for (size_t i = 0; i < text.size(); ++i) {
    if (chars.find(text[i]) == Model::npos) continue;
    text.insert(i, 1, ESC);
    ++i;
  }
  return text;
}

inline Model removeEscapes(Model text) {
  for (size_t i = 0; i < text.size(); ++i) {
    bool marked = text[i] == ESC;
    if (marked && i + 1 < text.size() && text[i + 1] == ESC) marked = i >= 1 && text[i - 1] == ESC;
    if (marked) text.erase(i, 1);
  }
  return text;
}

inline Model trim(Model text) {
  constexpr const char16_t* WHITE = u" \t\n\v\f\r";
  text.erase(text.find_last_not_of(WHITE) + 1);
  text.erase(0, text.find_first_not_of(WHITE));
  return text;
}

inline Model replace(const Model& text, const Model& from, const Model& to) {
  if (from.empty()) return text;
  Model result;
  for (size_t i = 0; i < text.size();) {
    if (text.compare(i, from.size(), from) == 0) {
      result += to;
      i += from.size();
    } else {
      result += text[i++];
    }
  }
  return result;
}

inline size_t findUnescaped(const Model& text, char16_t c, size_t start) {
  for (size_t i = start; i < text.size(); ++i) {
    if (text[i] != c) continue;
    if (i == start || text[i - 1] != ESC) return i;
    size_t further = 0;
    while (i >= 2 + further && text[i - 2 - further] == ESC) ++further;
    if (further % 2 == 1) return i;
  }
  return Model::npos;
}

inline unsigned int position(size_t found) {
  return found == Model::npos ? VMQ::String::NPOS : static_cast<unsigned int>(found);
}

inline VMQ::String textOf(const Model& model) {
  VMQ::String text;
  for (const char16_t unit : model) text.append(static_cast<unsigned short>(unit));
  return text;
}

}  // namespace text_model
