#pragma once
// Rows as a table for people or as JSON for programs. Returns text; nothing is written here.

#include <string>
#include <vector>

#include "apps/vmqctl/console.h"
#include "apps/vmqctl/predicates.h"

namespace vmqctl {

enum class Format { AsTable, AsJson };

/// How a table may look: `width` columns at most (0: as many as it takes), in this character set.
struct Layout {
  std::size_t width = 0;
  Charset charset = Charset::Utf8;
};

/// What fits this stream.
Layout layoutFor(const Stream& stream);

/// Rows (JSON objects) below `names`, those of their columns, numbers to the right. Each row is one line: control
/// characters are escaped. In a limited width long texts are cut and end in "..."; when not even the names fit, each
/// row is written as one COLUMN VALUE line for each column, and nothing is cut.
std::string table(const std::vector<std::string>& names, const std::vector<Json>& rows, const Layout& layout);

/// Names and values below each other. Long values go on in the next line when the width is limited.
std::string record(const Json& object, const Layout& layout);

/// The text of a value as tables show it, not escaped.
std::string plain(const Json& value);

/// A text of several lines: byte for byte, but on a terminal with everything but the line ends escaped.
std::string linesText(std::string_view text, const Stream& stream);

/// JSON text, a line end behind it. On a terminal everything above ASCII is escaped.
std::string jsonText(const Json& value, bool oneLine, const Stream& stream);

}  // namespace vmqctl
