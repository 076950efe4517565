#ifndef QV_TOOLS_PRINTABLETEXT_H
#define QV_TOOLS_PRINTABLETEXT_H

#include <string>

// Escapes a text from outside (a name, a path, a log line) for printing: the result is one line
// without terminal control characters and without characters that change the line's direction.
//
// - "\xNN": a control character below U+0020, DEL, and each byte that is not UTF-8
// - "\uNNNN": a control character from U+0080 to U+009F, the line and paragraph separators, and
//   the characters that change the direction of writing
//
// All other characters stay, the backslash too: the result is for people and cannot be read back.
// Every text printed for people passes through here; JSON has its own escapes.
std::string PrintableText(const std::string& strText);

#endif
