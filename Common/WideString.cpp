#include "Common/WideString.h"

#include <cctype>
#include <cstdint>
#include <cstring>
#include <cwchar>

namespace
{

constexpr wchar_t CASE_DISTANCE = L'a' - L'A';

// Results of _CompareString.
constexpr int COMPARE_BEFORE = 1;
constexpr int COMPARE_EQUAL = 2;
constexpr int COMPARE_AFTER = 3;

// Units are signed on some processors and unsigned on others: the unsigned difference is the same
// on all of them and never overflows.
int UnitDifference(wchar_t cLeft, wchar_t cRight)
{
    return static_cast<int>(static_cast<uint32_t>(cLeft) - static_cast<uint32_t>(cRight));
}

bool StartsInside(const void* pTarget, const void* pSource, size_t uSize)
{
    const uintptr_t uTarget = reinterpret_cast<uintptr_t>(pTarget);
    const uintptr_t uSource = reinterpret_cast<uintptr_t>(pSource);
    return uTarget > uSource && uTarget - uSource < uSize;
}

} // namespace

size_t _wcslen(const wchar_t* szText)
{
    return std::wcslen(szText);
}

wchar_t* _wcscpy(wchar_t* szTarget, const wchar_t* szSource)
{
    if (szTarget != nullptr && szSource != nullptr)
    {
        std::wcscpy(szTarget, szSource);
    }
    return szTarget;
}

wchar_t* _wcsncpy(wchar_t* szTarget, const wchar_t* szSource, size_t uCount)
{
    if (szTarget != nullptr && szSource != nullptr)
    {
        std::wcsncpy(szTarget, szSource, uCount);
    }
    return szTarget;
}

wchar_t* _wcscat(wchar_t* szTarget, const wchar_t* szSource)
{
    if (szTarget != nullptr && szSource != nullptr)
    {
        std::wcscat(szTarget, szSource);
    }
    return szTarget;
}

int _wcscmp(const wchar_t* szLeft, const wchar_t* szRight)
{
    while (*szLeft == *szRight && *szLeft != 0)
    {
        ++szLeft;
        ++szRight;
    }
    return UnitDifference(*szLeft, *szRight);
}

int _wcsncmp(const wchar_t* szLeft, const wchar_t* szRight, size_t uCount)
{
    for (size_t i = 0; i < uCount; ++i)
    {
        if (szLeft[i] != szRight[i] || szLeft[i] == 0)
        {
            return UnitDifference(szLeft[i], szRight[i]);
        }
    }
    return 0;
}

const wchar_t* _wcsstr(const wchar_t* szText, const wchar_t* szKey)
{
    return szText == nullptr || szKey == nullptr ? nullptr : std::wcsstr(szText, szKey);
}

wchar_t _towlower(wchar_t cUnit)
{
    return cUnit >= L'A' && cUnit <= L'Z' ? static_cast<wchar_t>(cUnit + CASE_DISTANCE) : cUnit;
}

wchar_t _towupr(wchar_t cUnit)
{
    return cUnit >= L'a' && cUnit <= L'z' ? static_cast<wchar_t>(cUnit - CASE_DISTANCE) : cUnit;
}

wchar_t* _wcslwr(wchar_t* szText)
{
    for (wchar_t* p = szText; *p != 0; ++p)
    {
        *p = _towlower(*p);
    }
    return szText;
}

wchar_t* _wcsupr(wchar_t* szText)
{
    for (wchar_t* p = szText; *p != 0; ++p)
    {
        *p = _towupr(*p);
    }
    return szText;
}

char* strupr(char* szText)
{
    for (char* p = szText; *p != 0; ++p)
    {
        *p = static_cast<char>(std::toupper(static_cast<unsigned char>(*p)));
    }
    return szText;
}

void* _memcpy(void* pTarget, const void* pSource, size_t uSize)
{
    if (pTarget == nullptr || pSource == nullptr)
    {
        return nullptr;
    }
    if (!StartsInside(pTarget, pSource, uSize))
    {
        return std::memmove(pTarget, pSource, uSize);
    }
    char* pTo = static_cast<char*>(pTarget);
    const char* pFrom = static_cast<const char*>(pSource);
    for (size_t i = 0; i < uSize; ++i)
    {
        pTo[i] = pFrom[i];
    }
    return pTarget;
}

int _CompareString(int /*iLocale*/, int /*iFlags*/, const wchar_t* szLeft, int iLeftLength,
                   const wchar_t* szRight, int iRightLength)
{
    const int iLength = iLeftLength > iRightLength ? iLeftLength : iRightLength;
    const int iOrder = _wcsncmp(szLeft, szRight, iLength > 0 ? static_cast<size_t>(iLength) : 0);
    if (iOrder == 0)
    {
        return COMPARE_EQUAL;
    }
    return iOrder < 0 ? COMPARE_BEFORE : COMPARE_AFTER;
}
