#include "Common/NumberText.h"

#include <algorithm>
#include <charconv>
#include <climits>
#include <cstdint>
#include <cstdlib>
#include <iterator>
#include <type_traits>

namespace
{

constexpr int DECIMAL_RADIX = 10;
// The longest text: a minus sign and a digit for each bit.
constexpr size_t MAX_NUMBER_TEXT = 1 + sizeof(unsigned long) * CHAR_BIT;

// A number's text. Only decimal ones have a sign.
class CNumberText
{
public:
    template <typename Number>
    CNumberText(Number number, int iRadix)
    {
        using Unsigned = std::make_unsigned_t<Number>;
        m_pEnd = iRadix == DECIMAL_RADIX ? std::to_chars(m_acText, std::end(m_acText), number).ptr
                                         : std::to_chars(m_acText, std::end(m_acText),
                                                         static_cast<Unsigned>(number), iRadix)
                                               .ptr;
    }

    size_t Length() const { return static_cast<size_t>(m_pEnd - m_acText); }
    void CopyTo(char* szBuffer) const { *std::copy(Begin(), m_pEnd, szBuffer) = 0; }
    void CopyUpperCaseTo(char* szBuffer) const
    {
        *std::transform(Begin(), m_pEnd, szBuffer,
                        [](char cDigit) {
                            return cDigit >= 'a' ? static_cast<char>(cDigit - 'a' + 'A') : cDigit;
                        }) = 0;
    }

private:
    const char* Begin() const { return m_acText; }

    char m_acText[MAX_NUMBER_TEXT];
    const char* m_pEnd;
};

} // namespace

int _atoi(const wchar_t* szText)
{
    uint32_t uValue = 0;
    for (; *szText >= L'0' && *szText <= L'9'; ++szText)
    {
        uValue = uValue * DECIMAL_RADIX + static_cast<uint32_t>(*szText - L'0');
    }
    return static_cast<int>(uValue);
}

char* itoa(int iValue, char* szBuffer, int iRadix)
{
    if (iRadix < NUMBER_MIN_RADIX || iRadix > NUMBER_MAX_RADIX)
    {
        return nullptr;
    }
    const CNumberText text(iValue, iRadix);
    if (szBuffer == nullptr)
    {
        szBuffer = static_cast<char*>(std::malloc(text.Length() + 1));
    }
    if (szBuffer != nullptr)
    {
        text.CopyTo(szBuffer);
    }
    return szBuffer;
}

void _ultoa(unsigned long ulValue, char* szBuffer, int iRadix)
{
    CNumberText(ulValue, iRadix).CopyUpperCaseTo(szBuffer);
}

void _ltoa(long lValue, char* szBuffer, int iRadix)
{
    CNumberText(lValue, iRadix).CopyUpperCaseTo(szBuffer);
}
