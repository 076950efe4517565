#ifndef QV_TOOLS_PRINTABLETEXT_H
#define QV_TOOLS_PRINTABLETEXT_H

#include <string>

// A text that others chose (a name, a path, a log line) as it may be shown to people: on one line,
// and without anything that a terminal obeys or that turns the direction of the line around.
//
// - "\xNN": a control character below U+0020, DEL, and each byte that is not UTF-8
// - "\uNNNN": a control character from U+0080 to U+009F, the line and paragraph separators, and
//   the characters that change the direction of writing
//
// All other characters stay, the backslash too: the form is for reading, and not to be read back.
// Every text printed for people passes through here; JSON has escapes of its own.
std::string PrintableText(const std::string& strText);

#endif
