#ifndef QV_LOCALIZERIMPL_PIECETABLE_H
#define QV_LOCALIZERIMPL_PIECETABLE_H

// What the pieces of one typed text do on the characters of names.
//
// Whether a piece fits a character depends on the piece and the character's readings alone, not
// on the contact. So characters that act alike share a key, and the matcher is called once per key,
// offset in the text and length; its answers are cached as sets of ends: bit e stands for a piece
// that ends before character e of the text.
//
//   text    z h a n g s          offset 0, key of the reading zhang:
//   offset  0 1 2 3 4 5          ends  1 2 3 4 5   (z, zh, zha, zhan, zhang)
//                                full          5   (zhang)
//
// A name then matches when its characters lead from offset 0 to the end of the text. The matcher
// is called when a name first needs the answer.

#include "LocalizerImpl/QVLocalizerManager.h"
#include "LocalizerImpl/ReadingSets.h"

#include <cstdint>
#include <memory>

class CPieceTable
{
public:
    // szInput, iInputLen characters (at most LOC_MAX_INPUT), the matcher and the sets outlive the
    // table.
    CPieceTable(CQVLocalizerManager& matcher, const CReadingSets& sets, const wchar_t* szInput,
                int iInputLen);
    CPieceTable(const CPieceTable&) = delete;
    CPieceTable& operator=(const CPieceTable&) = delete;

    // False if the allocation failed; then nothing else may be called.
    bool IsReady() const { return m_bReady; }

    // The keys of the sets, and behind them one for each typed character. Whatever a damaged
    // record holds has a key too.
    int KeyCount() const { return m_sets.KeyCount() + m_iInputLen; }
    int KeyOf(wchar_t code) const
    {
        const uint32_t uCode = static_cast<uint32_t>(code);
        return uCode < CReadingSets::CODE_COUNT ? m_pKeys[uCode] : KeyOfWide(code);
    }
    // A typed character means what the characters of its readings mean.
    tag_KeyMeaning MeaningOf(int iKey) const;

    // Where pieces from the offset on that fit the key end. Each offset has a table of its own:
    // the first one, which tells most names apart, stays in the nearest cache.
    unsigned Ends(int iKey, int iOffset)
    {
        const uint16_t uEnds = *EndsOf(iKey, iOffset);
        return uEnds != NOT_ASKED ? uEnds : AskEnds(iKey, iOffset);
    }

    // Whether the piece from iOffset to iEnd, one of its Ends, leaves a run of whole readings.
    bool IsFull(int iKey, int iOffset, int iEnd) const
    {
        return ((unsigned{*FullOf(iKey, iOffset)} >> iEnd) & 1U) != 0;
    }

    int InputLength() const { return m_iInputLen; }
    const CReadingSets& Sets() const { return m_sets; }

    // The piece from iOffset to iEnd, valid until the next call.
    wchar_t* Piece(int iOffset, int iEnd);

private:
    static constexpr uint16_t NOT_ASKED = UINT16_MAX;

    uint16_t* EndsOf(int iKey, int iOffset) const
    {
        return m_pEnds.get() + (iOffset * KeyCount() + iKey);
    }
    uint16_t* FullOf(int iKey, int iOffset) const
    {
        return m_pFull.get() + (iOffset * KeyCount() + iKey);
    }
    bool AddTypedKeys();
    int KeyOfWide(wchar_t code) const;
    wchar_t TypedUnit(int iKey) const;
    unsigned AskEnds(int iKey, int iOffset);
    bool Fits(int iKey, wchar_t* szPiece, bool& bFull);
    bool AskLastPieces();

    CQVLocalizerManager& m_matcher;
    const CReadingSets& m_sets;
    const wchar_t* m_szInput;
    int m_iInputLen;
    const uint16_t* m_pKeys; // of the codes below CReadingSets::CODE_COUNT
    bool m_bReady = false;
    uint16_t m_uValidLast = 0; // offsets whose last piece the matcher finds worth trying
    std::unique_ptr<uint16_t[]> m_pOwnKeys;    // where a Chinese character was typed
    std::unique_ptr<uint16_t[]> m_pEnds;       // by offset, then by key
    std::unique_ptr<uint16_t[]> m_pFull;       // the same: those Ends that take whole readings
    wchar_t m_aszUnits[LOC_MAX_INPUT][2] = {}; // the pieces of one character, the most frequent
    wchar_t m_szPiece[LOC_PIECE_BUFFER] = {};
};

#endif
