#ifndef QV_LOCALIZERIMPL_FINDINGS_H
#define QV_LOCALIZERIMPL_FINDINGS_H

#include "LocalizerImpl/FirstFound.h"
#include "LocalizerImpl/PieceTable.h"

#include <cstdint>
#include <memory>

// What a search finds out besides its matches: the next keys and the candidate characters.
//
// What a character adds to the key mask depends on its key alone, so it is marked per key and added
// once at the end, in any order. Candidate characters have an order, that of the first split and
// contact that meets them: CFirstFound keeps it.
class CFindings
{
public:
    // The table outlives the object.
    explicit CFindings(CPieceTable& table);
    CFindings(const CFindings&) = delete;
    CFindings& operator=(const CFindings&) = delete;

    // False if the allocation failed; then nothing else may be called.
    bool IsReady() const { return m_pMarks != nullptr; }

    // A character of the key took the piece from iOffset to the end of the text.
    void MarkLastPiece(int iKey, int iOffset)
    {
        tag_Mark& mark = m_pMarks[static_cast<size_t>(iKey)];
        mark.uLastOffsets = static_cast<uint16_t>(mark.uLastOffsets | (1U << iOffset));
    }
    // A character of the key stands behind a matched run.
    void MarkBehindRun(int iKey) { m_pMarks[static_cast<size_t>(iKey)].bBehindRun = true; }
    // Which character took a last piece: that of iCandidate with this Chinese code.
    void NoteCharacter(uint32_t uSplit, int32_t iCandidate, uint16_t uCode)
    {
        if (m_firstFound.IsEarly(uSplit, iCandidate))
        {
            m_firstFound.Add(uSplit, iCandidate, uCode, m_table.Sets());
        }
    }

    // Feeds the mask and the candidate characters of the matcher.
    void Report(CQVLocalizerManager& matcher);

private:
    struct tag_Mark
    {
        uint16_t uLastOffsets; // offsets from which a character took the last piece
        bool bBehindRun;
    };

    void OfferLastPiece(CQVLocalizerManager& matcher, PYOFWORDS& record, int iOffset);

    CPieceTable& m_table;
    std::unique_ptr<tag_Mark[]> m_pMarks; // by key
    CFirstFound m_firstFound;
};

#endif
