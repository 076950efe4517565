#ifndef QV_TOOLS_UTF8TEXT_H
#define QV_TOOLS_UTF8TEXT_H

#include <string>
#include <vector>

// UTF-8 as one wide unit per character, as the library counts them, and back. The text ends
// before the first character that the library cannot decode (malformed, or beyond U+FFFF); then
// *pbWhole, if given, is false.
std::wstring WideText(const std::string& strUtf8, bool* pbWhole = nullptr);
std::string Utf8Text(const std::wstring& wstrText);

// The bytes of each character.
std::vector<std::string> Characters(const std::string& strUtf8);

#endif
