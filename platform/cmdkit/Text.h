// Quoting a value in a message: whatever the value holds, the message stays one short line of
// valid UTF-8 that cannot steer a terminal.
#pragma once

#include <string>
#include <string_view>

namespace CmdKit {

// `value` as a message quotes it. Printable text stands as it is; a line feed, tab or carriage
// return shows as `\n`, `\t`, `\r`, another control character or a byte that is not valid UTF-8
// as `\xNN`, and a C1 control, a line or paragraph separator or a bidirectional control as
// `\uNNNN`. When that is longer than 128 characters, its first 128 are kept, followed by
// `... (N bytes)` with the value's whole length.
std::string MessageExcerpt(std::string_view value);

// Text for a Markdown table cell or paragraph: no HTML, no cell break, line breaks as `<br>`.
std::string MarkdownText(std::string_view text);
// A Markdown code span; a table cell break inside it is escaped too.
std::string MarkdownCode(std::string_view text);

}  // namespace CmdKit
