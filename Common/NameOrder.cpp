#include "Common/NameOrder.h"

#include "Common/WideString.h"
#include "Core/Records/LocalizerCodes.h"

#include <cwchar>

namespace
{

constexpr int COMPARE_EQUAL = 2; // of _CompareString: 1 before, 2 equal, 3 after

int BoundedLength(const wchar_t (&szName)[CONTACT_MAX_NAME + 1])
{
    return static_cast<int>(wcsnlen(szName, CONTACT_MAX_NAME + 1));
}

// 1 if only a has a property that sorts after others, -1 if only b has it, else 0.
int BehindByProperty(bool bHasA, bool bHasB)
{
    return static_cast<int>(bHasA) - static_cast<int>(bHasB);
}

// A Latin letter sorts before a Chinese character under the same first letter.
int BehindByScript(wchar_t codeA, wchar_t codeB)
{
    if (IsHanZiCode(CodeBits(codeA)) && IsAlphaCode(CodeBits(codeB)))
    {
        return 1;
    }
    return IsAlphaCode(CodeBits(codeA)) && IsHanZiCode(CodeBits(codeB)) ? -1 : 0;
}

} // namespace

int CompareNameText(const tag_ContactsStruct& a, const tag_ContactsStruct& b)
{
    return _CompareString(0, 0, a.szName, BoundedLength(a.szName), b.szName,
                          BoundedLength(b.szName)) -
           COMPARE_EQUAL;
}

bool NameSortsBehind(const tag_ContactsStruct& a, const tag_ContactsStruct& b)
{
    const wchar_t codeA = a.szLocalizerKey[0];
    const wchar_t codeB = b.szLocalizerKey[0];
    int iBehind = a.szName[0] == b.szName[0] ? BehindByScript(codeA, codeB) : 0;
    if (iBehind == 0)
    {
        iBehind = BehindByProperty(a.szName[0] == NAME_EMPTY_MARK, b.szName[0] == NAME_EMPTY_MARK);
    }
    if (iBehind == 0)
    {
        iBehind = BehindByProperty(codeA == LOC_OTHER, codeB == LOC_OTHER);
    }
    if (iBehind == 0)
    {
        iBehind = BehindByProperty(IsDigitCode(CodeBits(codeA)), IsDigitCode(CodeBits(codeB)));
    }
    return iBehind != 0 ? iBehind > 0 : CompareNameText(a, b) > 0;
}
