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

    // Where pieces from the offset on that fit the key end.
    unsigned Ends(int iKey, int iOffset)
    {
        const unsigned uEnds = RowOf(iKey).auEnds[iOffset];
        return uEnds != NOT_ASKED ? uEnds & ~ASKED : AskEnds(iKey, iOffset);
    }
    // Those of the Ends asked for that leave a run of whole readings.
    unsigned FullEnds(int iKey, int iOffset) const { return RowOf(iKey).auFull[iOffset]; }
    // Offsets from which no piece fits the key, as far as they were asked for.
    unsigned DeadOffsets(int iKey) const { return RowOf(iKey).uDead; }

    int InputLength() const { return m_iInputLen; }
    const CReadingSets& Sets() const { return m_sets; }

    // The piece from iOffset to iEnd, valid until the next call.
    wchar_t* Piece(int iOffset, int iEnd);

private:
    static constexpr uint16_t NOT_ASKED = 0;
    static constexpr unsigned ASKED = 1; // no piece ends at offset 0

    // What the pieces do on one key.
    struct tag_Row
    {
        uint16_t uDead;                 // offsets
        uint16_t auEnds[LOC_MAX_INPUT]; // by offset; NOT_ASKED, or with ASKED
        uint16_t auFull[LOC_MAX_INPUT]; // by offset
    };

    const tag_Row& RowOf(int iKey) const { return m_pRows.get()[iKey]; }
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
    std::unique_ptr<tag_Row[]> m_pRows;        // by key
    wchar_t m_aszUnits[LOC_MAX_INPUT][2] = {}; // the pieces of one character, the most frequent
    wchar_t m_szPiece[LOC_PIECE_BUFFER] = {};
};

#endif
