#ifndef QV_LOCALIZERIMPL_MATCHERTEXT_H
#define QV_LOCALIZERIMPL_MATCHERTEXT_H

// What matchers and searches ask of pieces, spellings and names.

#include "Core/Records/LocalizerCodes.h"
#include "LocalizerImpl/PinyinTable.h"

#include <utils/Vector.h>

// Bytes of a spelling's slot, which in a damaged table may all be letters.
constexpr int SPELLING_SLOT = PY_MAX_LETTERS + 1;

// Length of a piece, counted to one more than a slot holds: longer pieces fit none.
inline int PieceLength(const wchar_t* szPiece)
{
    int iLength = 0;
    while (iLength <= SPELLING_SLOT && szPiece[iLength] != 0)
    {
        ++iLength;
    }
    return iLength;
}

constexpr uint32_t ASCII_MAX = 0x7F;

// Whether the first iLength units of the piece, none of them 0, begin the spelling. Only ASCII
// fits.
inline bool BeginsSpelling(const wchar_t* szPiece, int iLength,
                           const char (&szSpelling)[SPELLING_SLOT])
{
    if (szSpelling[0] == 0 || iLength > SPELLING_SLOT)
    {
        return false;
    }
    for (int i = 0; i < iLength; ++i)
    {
        const uint32_t uUnit = static_cast<uint32_t>(szPiece[i]);
        if (uUnit != static_cast<unsigned char>(szSpelling[i]) || uUnit > ASCII_MAX)
        {
            return false;
        }
    }
    return true;
}

// Whether the piece is exactly the one unit.
inline bool IsUnit(const wchar_t* szPiece, wchar_t unit)
{
    return szPiece != nullptr && unit != 0 && szPiece[0] == unit && szPiece[1] == 0;
}

// The piece that ends the typed text; null when a split has none.
inline wchar_t* LastPiece(const android::Vector<wchar_t*>& vPieces)
{
    return vPieces.isEmpty() ? nullptr : vPieces[0];
}

// Number of codes of a name, at most CONTACT_MAX_KEY.
inline int NameLength(const wchar_t* pCodes)
{
    int iLength = 0;
    while (iLength < CONTACT_MAX_KEY && pCodes[iLength] != 0)
    {
        ++iLength;
    }
    return iLength;
}

#endif
