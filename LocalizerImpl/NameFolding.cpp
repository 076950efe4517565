#include "LocalizerImpl/NameFolding.h"

#include "LocalizerImpl/FoldingLookup.h"

#include <cstdint>

namespace
{

// A surname and a given name: what lies behind only adds cost to every conversion.
constexpr int FOLDED_CHARACTERS = 4;

wchar_t Fold(wchar_t unit)
{
    const uint32_t uUnit = static_cast<uint32_t>(unit);
    if (uUnit < FOLD_FIRST || uUnit > FOLD_LAST)
    {
        return unit;
    }
    const char16_t folded = g_foldedCharacters[uUnit - FOLD_FIRST];
    return folded == 0 ? unit : static_cast<wchar_t>(folded);
}

} // namespace

void Ft2Jt(wchar_t* szText)
{
    for (int i = 0; szText != nullptr && i < FOLDED_CHARACTERS && szText[i] != 0; ++i)
    {
        szText[i] = Fold(szText[i]);
    }
}
