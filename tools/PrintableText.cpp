#include "tools/PrintableText.h"

#include <cstdint>
#include <cstdio>

namespace
{

constexpr size_t ESCAPE_BUFFER = 16;

struct tag_Range
{
    uint32_t uFirst;
    uint32_t uLast;
};

constexpr tag_Range ESCAPED[] = {
    {0x00, 0x1F},     // C0 controls
    {0x7F, 0x9F},     // DEL and the C1 controls
    {0x061C, 0x061C}, // Arabic letter mark
    {0x200E, 0x200F}, // left-to-right and right-to-left mark
    {0x2028, 0x2029}, // line and paragraph separator
    {0x202A, 0x202E}, // embeddings and overrides of the direction
    {0x2066, 0x206F}, // isolates, and the deprecated format characters
};

// Encoded forms by their number of bytes: the fixed bits of the first byte, and the smallest
// character that needs so many bytes.
struct tag_Form
{
    uint8_t uMask;
    uint8_t uLead;
    uint32_t uSmallest;
};

constexpr tag_Form FORMS[] = {
    {0x80, 0x00, 0x0}, {0xE0, 0xC0, 0x80}, {0xF0, 0xE0, 0x800}, {0xF8, 0xF0, 0x10000}};

constexpr uint32_t LAST_CHARACTER = 0x10FFFF;
constexpr tag_Range SURROGATES = {0xD800, 0xDFFF};
constexpr unsigned CONTINUATION_BITS = 6;
constexpr uint8_t CONTINUATION_MASK = 0xC0;
constexpr uint8_t CONTINUATION_LEAD = 0x80;

bool IsIn(uint32_t uCharacter, const tag_Range& range)
{
    return uCharacter >= range.uFirst && uCharacter <= range.uLast;
}

bool IsEscaped(uint32_t uCharacter)
{
    for (const tag_Range& range : ESCAPED)
    {
        if (IsIn(uCharacter, range))
        {
            return true;
        }
    }
    return false;
}

uint8_t ByteAt(const std::string& strText, size_t uAt)
{
    return static_cast<uint8_t>(strText[uAt]);
}

// Adds the uMore continuation bytes after uAt to uCharacter; false if one is missing.
bool Continue(const std::string& strText, size_t uAt, size_t uMore, uint32_t& uCharacter)
{
    for (size_t i = uAt + 1; i <= uAt + uMore; ++i)
    {
        if (i >= strText.size() || (ByteAt(strText, i) & CONTINUATION_MASK) != CONTINUATION_LEAD)
        {
            return false;
        }
        uCharacter = uCharacter << CONTINUATION_BITS |
                     (ByteAt(strText, i) & static_cast<uint8_t>(~CONTINUATION_MASK));
    }
    return true;
}

// The number of bytes of the well-formed character at uAt, 0 if there is none.
size_t Decode(const std::string& strText, size_t uAt, uint32_t& uCharacter)
{
    size_t uMore = 0;
    for (const tag_Form& form : FORMS)
    {
        const uint8_t uLead = ByteAt(strText, uAt);
        if ((uLead & form.uMask) == form.uLead)
        {
            uCharacter = uLead & static_cast<uint8_t>(~form.uMask);
            const bool bWhole = Continue(strText, uAt, uMore, uCharacter) &&
                                uCharacter >= form.uSmallest && uCharacter <= LAST_CHARACTER &&
                                !IsIn(uCharacter, SURROGATES);
            return bWhole ? uMore + 1 : 0;
        }
        ++uMore;
    }
    return 0;
}

std::string Escape(const char* szFormat, uint32_t uValue)
{
    char szText[ESCAPE_BUFFER];
    std::snprintf(szText, sizeof(szText), szFormat, uValue);
    return szText;
}

} // namespace

std::string PrintableText(const std::string& strText)
{
    std::string strPrintable;
    for (size_t uAt = 0; uAt < strText.size();)
    {
        uint32_t uCharacter = 0;
        const size_t uBytes = Decode(strText, uAt, uCharacter);
        if (uBytes == 0 || (uBytes == 1 && IsEscaped(uCharacter)))
        {
            strPrintable += Escape("\\x%02x", ByteAt(strText, uAt));
            ++uAt;
            continue;
        }
        strPrintable +=
            IsEscaped(uCharacter) ? Escape("\\u%04x", uCharacter) : strText.substr(uAt, uBytes);
        uAt += uBytes;
    }
    return strPrintable;
}
