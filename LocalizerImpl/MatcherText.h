#ifndef QV_LOCALIZERIMPL_MATCHERTEXT_H
#define QV_LOCALIZERIMPL_MATCHERTEXT_H

// What both matchers ask of pieces and spellings.

#include "Core/LocalizerCodes.h"
#include "LocalizerImpl/PinyinTable.h"

#include <utils/Vector.h>

// Length of a piece, counted to one more than a reading has letters: longer pieces fit none.
inline int PieceLength(const wchar_t* szPiece)
{
    int iLength = 0;
    while (iLength <= PY_MAX_LETTERS && szPiece[iLength] != 0)
    {
        ++iLength;
    }
    return iLength;
}

// Whether the first iLength units of the piece, none of them 0, begin the spelling. Spellings are
// ASCII, and in a damaged table one may fill its slot without a terminator.
inline bool BeginsSpelling(const wchar_t* szPiece, int iLength,
                           const char (&szSpelling)[PY_MAX_LETTERS + 1])
{
    if (szSpelling[0] == 0 || iLength > PY_MAX_LETTERS + 1)
    {
        return false;
    }
    for (int i = 0; i < iLength; ++i)
    {
        if (szPiece[i] != static_cast<wchar_t>(static_cast<unsigned char>(szSpelling[i])))
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

#endif
