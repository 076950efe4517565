#include "Common/Utf8.h"

#include "Common/WideString.h"

#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <new>

namespace
{

constexpr uint32_t MAX_ONE_BYTE = 0x7F;
constexpr uint32_t MAX_TWO_BYTES = 0x7FF;
constexpr uint32_t MAX_THREE_BYTES = 0xFFFF;
constexpr uint32_t REPLACEMENT_CHARACTER = 0xFFFD;

constexpr unsigned LEAD_TWO = 0xC0;
constexpr unsigned LEAD_THREE = 0xE0;
constexpr unsigned LEAD_FOUR = 0xF0;
constexpr unsigned CONTINUATION = 0x80;
constexpr unsigned CONTINUATION_MASK = 0xC0;
constexpr unsigned CONTINUATION_BITS = 0x3F;
constexpr int BITS_PER_BYTE = 6; // that a continuation byte carries
constexpr int MAX_BYTES_PER_UNIT = 3;

constexpr int FORMATTED_BYTES = 1024; // room of _u_wsprintf for its text and the terminator
constexpr int PRINT_CHUNK_UNITS = 128;

bool IsContinuation(unsigned char uByte)
{
    return (uByte & CONTINUATION_MASK) == CONTINUATION;
}

// Bytes of the character that the lead byte begins; 0 when it begins none that is decoded.
int LengthOf(unsigned char uLead)
{
    if (uLead <= MAX_ONE_BYTE)
    {
        return 1;
    }
    if (uLead < LEAD_TWO || uLead >= LEAD_FOUR)
    {
        return 0;
    }
    return uLead < LEAD_THREE ? 2 : 3;
}

// Decodes the character at pBytes, of which iAvailable bytes (at least 1) may be read; the number
// of its bytes, or 0. Never reads past a zero byte.
int DecodeCharacter(const unsigned char* pBytes, int iAvailable, wchar_t& cUnit)
{
    const int iLength = LengthOf(pBytes[0]);
    if (iLength == 0 || iLength > iAvailable)
    {
        return 0;
    }
    if (iLength == 1)
    {
        cUnit = static_cast<wchar_t>(pBytes[0]);
        return iLength;
    }
    uint32_t uValue = pBytes[0] & (iLength == 2 ? ~LEAD_THREE : ~LEAD_FOUR);
    for (int i = 1; i < iLength; ++i)
    {
        if (!IsContinuation(pBytes[i]))
        {
            return 0;
        }
        uValue = (uValue << BITS_PER_BYTE) | (pBytes[i] & CONTINUATION_BITS);
    }
    cUnit = static_cast<wchar_t>(uValue);
    return iLength;
}

// Writes the character to pBytes, which has room for three; the number of its bytes.
int EncodeCharacter(uint32_t uValue, char* pBytes)
{
    if (uValue > MAX_THREE_BYTES)
    {
        uValue = REPLACEMENT_CHARACTER;
    }
    if (uValue <= MAX_ONE_BYTE)
    {
        pBytes[0] = static_cast<char>(uValue);
        return 1;
    }
    const unsigned uLast = CONTINUATION | (uValue & CONTINUATION_BITS);
    const uint32_t uUpper = uValue >> BITS_PER_BYTE;
    if (uValue <= MAX_TWO_BYTES)
    {
        pBytes[0] = static_cast<char>(LEAD_TWO | uUpper);
        pBytes[1] = static_cast<char>(uLast);
        return 2;
    }
    pBytes[0] = static_cast<char>(LEAD_THREE | (uUpper >> BITS_PER_BYTE));
    pBytes[1] = static_cast<char>(CONTINUATION | (uUpper & CONTINUATION_BITS));
    pBytes[2] = static_cast<char>(uLast);
    return 3;
}

// Decodes up to the terminator, the bound or the first character that cannot be decoded; false in
// the last case. iWritten counts the units that szTarget got.
bool Decode(const char* szSource, wchar_t* szTarget, int iLastByte, int& iWritten)
{
    iWritten = 0;
    const unsigned char* pBytes = reinterpret_cast<const unsigned char*>(szSource);
    for (int iByte = 0; iByte <= iLastByte && pBytes[iByte] != 0;)
    {
        // One less than what is left, so that the largest bound does not overflow.
        const int iLeft = iLastByte - iByte;
        const int iAvailable = iLeft < MAX_BYTES_PER_UNIT ? iLeft + 1 : MAX_BYTES_PER_UNIT;
        const int iLength = DecodeCharacter(pBytes + iByte, iAvailable, szTarget[iWritten]);
        if (iLength == 0)
        {
            return false;
        }
        iByte += iLength;
        ++iWritten;
    }
    return true;
}

// Formats into szText, which has FORMATTED_BYTES; the length, or -1 when that fails or is cut.
__attribute__((format(printf, 2, 0))) int Format(char* szText, const char* szFormat, va_list args)
{
    const int iLength = std::vsnprintf(szText, FORMATTED_BYTES, szFormat, args);
    return iLength < FORMATTED_BYTES ? iLength : -1;
}

// The same with a wide format.
int FormatWide(char* szText, const wchar_t* szFormat, va_list args)
{
    const size_t uUnits = _wcslen(szFormat);
    const std::unique_ptr<char[]> format(
        new (std::nothrow) char[uUnits * MAX_BYTES_PER_UNIT + 1]());
    if (format == nullptr)
    {
        return -1;
    }
    _wcstombs(format.get(), szFormat, static_cast<int>(uUnits));
    return Format(szText, format.get(), args);
}

} // namespace

int Utf82Unicode(const char* szSource, wchar_t* szTarget, int iLastByte)
{
    if (szSource == nullptr || szTarget == nullptr)
    {
        return 0;
    }
    int iWritten = 0;
    return Decode(szSource, szTarget, iLastByte, iWritten) ? iWritten : UTF8_ERR_INVALID;
}

int Unicode2Utf8(const wchar_t* szSource, char* szTarget, int iLastUnit)
{
    if (szSource == nullptr || szTarget == nullptr)
    {
        return 0;
    }
    int iWritten = 0;
    for (int i = 0; i <= iLastUnit && szSource[i] != 0; ++i)
    {
        iWritten += EncodeCharacter(static_cast<uint32_t>(szSource[i]), szTarget + iWritten);
    }
    return iWritten;
}

int _mbstowcs(wchar_t* szTarget, const char* szSource, int iLastByte)
{
    return Utf82Unicode(szSource, szTarget, iLastByte);
}

int _wcstombs(char* szTarget, const wchar_t* szSource, int iLastUnit)
{
    return Unicode2Utf8(szSource, szTarget, iLastUnit);
}

int _wprintf(const wchar_t* szFormat, ...)
{
    char szChunk[PRINT_CHUNK_UNITS * MAX_BYTES_PER_UNIT];
    size_t uPrinted = 0;
    for (const wchar_t* p = szFormat; p != nullptr && *p != 0;)
    {
        // A chunk ends early only where the text ends.
        const int iBytes = _wcstombs(szChunk, p, PRINT_CHUNK_UNITS - 1);
        uPrinted += std::fwrite(szChunk, 1, static_cast<size_t>(iBytes), stdout);
        for (int i = 0; i < PRINT_CHUNK_UNITS && *p != 0; ++i)
        {
            ++p;
        }
    }
    uPrinted += std::fwrite("\n", 1, 1, stdout);
    return static_cast<int>(uPrinted);
}

int _u_wsprintf(wchar_t* szTarget, const wchar_t* szFormat, ...)
{
    if (szTarget == nullptr || szFormat == nullptr)
    {
        return -1;
    }
    char szText[FORMATTED_BYTES];
    va_list args;
    va_start(args, szFormat);
    const int iLength = FormatWide(szText, szFormat, args);
    va_end(args);
    if (iLength < 0)
    {
        return -1;
    }
    int iUnits = 0;
    Decode(szText, szTarget, iLength, iUnits);
    szTarget[iUnits] = 0;
    return iLength + 1;
}
