#ifndef QV_LOCALIZERIMPL_PIECETABLE_H
#define QV_LOCALIZERIMPL_PIECETABLE_H

// What the pieces of one typed text do on the characters of names.
//
// Whether a piece fits a character depends on the two alone, not on the contact. So the matcher
// is asked once per character code, offset in the text and length, and the answers stand in one
// row of 64 bytes per code:
//
//   text    z h a n g s          offset 0, row of a character read zhang:
//   offset  0 1 2 3 4 5          ends  1 2 3 4 5   (z, zh, zha, zhan, zhang)
//                                full          5   (zhang)
//
// A name then matches when its characters lead from offset 0 to the end of the text.
// Rows are filled when a name first asks for them.

#include "LocalizerImpl/QVLocalizerManager.h"

#include <cstdint>
#include <memory>

// One row. Bit e of a set of ends stands for a piece that ends before character e of the text.
struct tag_PieceRow
{
    uint16_t auEnds[LOC_MAX_INPUT]; // by offset: where pieces that fit end
    uint16_t auFull[LOC_MAX_INPUT]; // by offset: those of them that leave a run of whole readings
    uint16_t uFilled;               // offsets whose two words above are known
    uint16_t uLastOffsets;          // offsets from which the character took the last piece
    wchar_t code;
    bool bBehindRun;      // the character stood behind a matched run
    uint64_t uFirstFound; // discovery key of its first last piece, NOT_FOUND without one
};

class CPieceTable
{
public:
    static constexpr uint64_t NOT_FOUND = UINT64_MAX;

    // szInput, iInputLen characters (at most LOC_MAX_INPUT), and the matcher outlive the table.
    CPieceTable(CQVLocalizerManager& matcher, PYOFWORDS* pMap, const wchar_t* szInput,
                int iInputLen);
    CPieceTable(const CPieceTable&) = delete;
    CPieceTable& operator=(const CPieceTable&) = delete;

    // The row of a code, valid as long as the table; without memory one that fits nothing.
    tag_PieceRow& RowOf(wchar_t code)
    {
        const int iKey = KeyOf(code);
        const uint16_t uRow = m_pRowOfKey == nullptr ? NO_ROW : m_pRowOfKey[iKey];
        return uRow != NO_ROW ? RowAt(uRow - 1) : AddRow(code, iKey);
    }

    // Where the text's first pieces that fit the code end. Most names are told apart by this
    // alone, so it has a table of its own that stays in the nearest cache.
    uint16_t FirstEnds(wchar_t code)
    {
        const int iKey = KeyOf(code);
        const uint16_t uEnds = m_pFirstEnds == nullptr ? NOT_ASKED : m_pFirstEnds[iKey];
        return uEnds != NOT_ASKED ? uEnds : AskFirstEnds(code, iKey);
    }

    // Where pieces from the offset on that fit the row's character end.
    uint16_t Ends(tag_PieceRow& row, int iOffset)
    {
        if (((row.uFilled >> iOffset) & 1U) == 0)
        {
            Fill(row, iOffset);
        }
        return row.auEnds[iOffset];
    }

    int InputLength() const { return m_iInputLen; }

    int RowCount() const { return m_iRows; }
    tag_PieceRow& RowAt(int iRow) { return m_apChunks[iRow / CHUNK_ROWS][iRow % CHUNK_ROWS]; }

    // The piece from iOffset to iEnd, valid until the next call.
    wchar_t* Piece(int iOffset, int iEnd);

private:
    // Rows of codes inside their ranges, then of codes outside.
    static constexpr int KEY_ALPHA = PY_WORD_COUNT;
    static constexpr int KEY_DIGIT = KEY_ALPHA + LOC_ALPHA_COUNT;
    static constexpr int KEY_OTHER = KEY_DIGIT + LOC_DIGIT_COUNT;
    static constexpr int KEY_WIDE_OTHER = KEY_OTHER + 1; // LOC_OTHER with upper bits set
    static constexpr int KEY_UNKNOWN = KEY_OTHER + 2;
    static constexpr int KEY_WIDE_TYPED = KEY_OTHER + 3; // a typed code with upper bits set
    static constexpr int KEY_COUNT = KEY_WIDE_TYPED + LOC_MAX_INPUT;
    static constexpr int CHUNK_ROWS = 256;
    static constexpr int CHUNK_COUNT = (KEY_COUNT + CHUNK_ROWS - 1) / CHUNK_ROWS;
    static constexpr uint16_t NO_ROW = 0;
    static constexpr uint16_t NOT_ASKED = UINT16_MAX;

    int KeyOf(wchar_t code) const
    {
        const uint32_t uCode = static_cast<uint32_t>(code);
        return uCode <= UINT16_MAX ? KeyOfBits(static_cast<uint16_t>(uCode)) : KeyOfWide(code);
    }
    static int KeyOfBits(uint16_t uCode)
    {
        return IsHanZiCode(uCode) ? uCode - LOC_HANZI_BASE : KeyOfOther(uCode);
    }
    static int KeyOfOther(uint16_t uCode);
    int KeyOfWide(wchar_t code) const;
    tag_PieceRow& AddRow(wchar_t code, int iKey);
    uint16_t AskFirstEnds(wchar_t code, int iKey);
    void Fill(tag_PieceRow& row, int iOffset);
    bool Fits(const tag_PieceRow& row, wchar_t* szPiece, bool& bFull);
    bool IsLastPieceValid(int iOffset);

    CQVLocalizerManager& m_matcher;
    PYOFWORDS* m_pMap;
    const wchar_t* m_szInput;
    int m_iInputLen;
    uint16_t m_uValidLast; // offsets whose last piece the matcher finds worth trying
    int m_iRows = 0;
    std::unique_ptr<uint16_t[]> m_pRowOfKey; // row + 1, or NO_ROW
    std::unique_ptr<uint16_t[]> m_pFirstEnds;
    std::unique_ptr<tag_PieceRow[]> m_apChunks[CHUNK_COUNT];
    tag_PieceRow m_noRow;
    wchar_t m_szPiece[LOC_PIECE_BUFFER] = {};
};

#endif
