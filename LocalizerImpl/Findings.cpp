#include "LocalizerImpl/Findings.h"

#include <new>

CFindings::CFindings(CPieceTable& table)
    : m_table(table), m_pMarks(new (std::nothrow) tag_Mark[static_cast<size_t>(table.KeyCount())]())
{
}

void CFindings::Report(CQVLocalizerManager& matcher)
{
    for (int i = 0; i < m_firstFound.Count(); ++i)
    {
        const CFirstFound::tag_Find& find = m_firstFound.At(i);
        PYOFWORDS record = m_table.Sets().RecordOf(find.code);
        OfferLastPiece(matcher, record, m_table.InputLength() - 1 - __builtin_ctz(find.Split()));
    }
    for (int iKey = 0; iKey < m_table.KeyCount(); ++iKey)
    {
        const tag_Mark& mark = m_pMarks[static_cast<size_t>(iKey)];
        if (mark.uLastOffsets == 0 && !mark.bBehindRun)
        {
            continue;
        }
        const tag_KeyMeaning meaning = m_table.MeaningOf(iKey);
        // The records of the sets have no character, so these add to the mask alone.
        for (unsigned uOffsets = meaning.pRecord != nullptr ? mark.uLastOffsets : 0; uOffsets != 0;
             uOffsets &= uOffsets - 1)
        {
            OfferLastPiece(matcher, *meaning.pRecord, __builtin_ctz(uOffsets));
        }
        if (mark.bBehindRun)
        {
            matcher.AddNextKey(meaning.code, meaning.pRecord);
        }
    }
}

void CFindings::OfferLastPiece(CQVLocalizerManager& matcher, PYOFWORDS& record, int iOffset)
{
    matcher.OfferLastPiece(m_table.Sets().Records(), record,
                           m_table.Piece(iOffset, m_table.InputLength()));
}
