#include "bindings/c/Utf8Text.h"

#include <climits>
#include <cstdint>
#include <cstring>

namespace
{

constexpr unsigned CONTINUATION = 0x80;
constexpr unsigned CONTINUATION_MASK = 0xC0;
constexpr unsigned CONTINUATION_BITS = 0x3F;
constexpr int BITS_PER_BYTE = 6; // that a continuation byte carries

constexpr uint32_t FIRST_SURROGATE = 0xD800;
constexpr uint32_t LAST_SURROGATE = 0xDFFF;
constexpr uint32_t LAST_CHARACTER = 0x10FFFF;

// The encoding of characters of one length.
struct tag_Form
{
    uint32_t uFirst;    // smallest character that needs so many bytes
    uint32_t uLast;     // largest character that they hold
    unsigned uLead;     // fixed bits of the first byte
    unsigned uLeadMask; // where they stand
};

constexpr tag_Form FORMS[UTF8_MAX_BYTES] = {
    {0, 0x7F, 0x00, 0x80},
    {0x80, 0x7FF, 0xC0, 0xE0},
    {0x800, 0xFFFF, 0xE0, 0xF0},
    {0x10000, LAST_CHARACTER, 0xF0, 0xF8},
};

bool IsIn(uint32_t uCharacter, const tag_Form& form)
{
    const bool bSurrogate = uCharacter >= FIRST_SURROGATE && uCharacter <= LAST_SURROGATE;
    return uCharacter >= form.uFirst && uCharacter <= form.uLast && !bSurrogate;
}

// Decodes the character at pBytes, which is not the terminator; the number of its bytes, or 0.
// Reads no byte after the terminator.
size_t DecodeCharacter(const unsigned char* pBytes, uint32_t& uCharacter)
{
    for (size_t uLength = 1; uLength <= UTF8_MAX_BYTES; ++uLength)
    {
        const tag_Form& form = FORMS[uLength - 1];
        if ((pBytes[0] & form.uLeadMask) != form.uLead)
        {
            continue;
        }
        uCharacter = pBytes[0] & ~form.uLeadMask;
        for (size_t i = 1; i < uLength; ++i)
        {
            if ((pBytes[i] & CONTINUATION_MASK) != CONTINUATION)
            {
                return 0;
            }
            uCharacter = (uCharacter << BITS_PER_BYTE) | (pBytes[i] & CONTINUATION_BITS);
        }
        return IsIn(uCharacter, form) ? uLength : 0;
    }
    return 0;
}

// Writes the character to pBytes; the number of its bytes, 0 for an invalid character.
size_t EncodeCharacter(uint32_t uCharacter, char (&szBytes)[UTF8_MAX_BYTES])
{
    for (size_t uLength = 1; uLength <= UTF8_MAX_BYTES; ++uLength)
    {
        const tag_Form& form = FORMS[uLength - 1];
        if (!IsIn(uCharacter, form))
        {
            continue;
        }
        for (size_t i = uLength - 1; i > 0; --i)
        {
            szBytes[i] = static_cast<char>(CONTINUATION | (uCharacter & CONTINUATION_BITS));
            uCharacter >>= BITS_PER_BYTE;
        }
        szBytes[0] = static_cast<char>(form.uLead | uCharacter);
        return uLength;
    }
    return 0;
}

// Encodes szText into szTarget, or only counts if that is null; the number of bytes.
size_t Encode(const wchar_t* szText, char* szTarget)
{
    size_t uWritten = 0;
    for (; *szText != 0; ++szText)
    {
        char szBytes[UTF8_MAX_BYTES];
        const size_t uBytes = EncodeCharacter(static_cast<uint32_t>(*szText), szBytes);
        if (szTarget != nullptr)
        {
            std::memcpy(szTarget + uWritten, szBytes, uBytes);
        }
        uWritten += uBytes;
    }
    return uWritten;
}

} // namespace

int DecodeText(const char* szText, wchar_t* szTarget, int iMaxUnits)
{
    const unsigned char* pBytes = reinterpret_cast<const unsigned char*>(szText);
    int iUnits = 0;
    while (*pBytes != 0)
    {
        uint32_t uCharacter = 0;
        const size_t uBytes = DecodeCharacter(pBytes, uCharacter);
        if (uBytes == 0)
        {
            return -1;
        }
        if (iUnits < iMaxUnits)
        {
            szTarget[iUnits] = static_cast<wchar_t>(uCharacter);
        }
        iUnits += iUnits < INT_MAX ? 1 : 0;
        pBytes += uBytes;
    }
    szTarget[iUnits < iMaxUnits ? iUnits : iMaxUnits] = 0;
    return iUnits;
}

bool EncodeText(const wchar_t* szText, char* szTarget, size_t uSize)
{
    const size_t uBytes = Encode(szText, nullptr);
    if (uBytes >= uSize)
    {
        return false;
    }
    szTarget[Encode(szText, szTarget)] = 0;
    return true;
}
