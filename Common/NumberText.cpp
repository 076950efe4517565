#include "Common/NumberText.h"

#include <climits>
#include <cstdint>
#include <cstdlib>
#include <cstring>

namespace
{

constexpr int DECIMAL_RADIX = 10;
constexpr const char* LOWER_DIGITS = "0123456789abcdefghijklmnopqrstuvwxyz";
constexpr const char* UPPER_DIGITS = "0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZ";

// Room for the longest text: a minus sign, a digit for each bit, the terminator.
constexpr int MAX_NUMBER_TEXT = 1 + static_cast<int>(sizeof(unsigned long)) * CHAR_BIT + 1;

// A number's text, built from its last digit to the front.
class CNumberText
{
public:
    CNumberText(unsigned long ulValue, int iRadix, const char* szDigits)
    {
        const unsigned long ulRadix = static_cast<unsigned long>(iRadix);
        do
        {
            Prepend(szDigits[ulValue % ulRadix]);
            ulValue /= ulRadix;
        } while (ulValue != 0);
    }

    void Prepend(char cFirst) { m_szText[--m_iStart] = cFirst; }
    // With the terminator.
    size_t Size() const { return static_cast<size_t>(MAX_NUMBER_TEXT - m_iStart); }
    void CopyTo(char* szBuffer) const { std::memcpy(szBuffer, m_szText + m_iStart, Size()); }

private:
    char m_szText[MAX_NUMBER_TEXT] = {};
    int m_iStart = MAX_NUMBER_TEXT - 1;
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
    const bool bMinus = iRadix == DECIMAL_RADIX && iValue < 0;
    const unsigned uBits = static_cast<unsigned>(iValue);
    CNumberText clText(bMinus ? 0U - uBits : uBits, iRadix, LOWER_DIGITS);
    if (bMinus)
    {
        clText.Prepend('-');
    }
    if (szBuffer == nullptr)
    {
        szBuffer = static_cast<char*>(std::malloc(clText.Size()));
    }
    if (szBuffer != nullptr)
    {
        clText.CopyTo(szBuffer);
    }
    return szBuffer;
}

void _ultoa(unsigned long ulValue, char* szBuffer, int iRadix)
{
    CNumberText(ulValue, iRadix, UPPER_DIGITS).CopyTo(szBuffer);
}

void _ltoa(long lValue, char* szBuffer, int iRadix)
{
    unsigned long ulValue = static_cast<unsigned long>(lValue);
    if (lValue < 0 && iRadix == DECIMAL_RADIX)
    {
        *szBuffer++ = '-';
        ulValue = 0UL - ulValue;
    }
    _ultoa(ulValue, szBuffer, iRadix);
}
