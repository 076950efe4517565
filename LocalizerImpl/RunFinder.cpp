#include "LocalizerImpl/RunFinder.h"

#include "LocalizerImpl/MatcherText.h"

#include <algorithm>
#include <iterator>

namespace
{

int LowestBit(unsigned uBits)
{
    return __builtin_ctz(uBits);
}

} // namespace

CRunFinder::CRunFinder(CPieceTable& table, CFindings& findings, bool bAnywhere)
    : m_table(table), m_findings(findings), m_states(table, bAnywhere), m_bAnywhere(bAnywhere),
      m_iSplitWords(((1 << std::max(table.InputLength() - 1, 0)) + WORD_BITS - 1) / WORD_BITS)
{
}

tag_NameMatch CRunFinder::Find(const wchar_t* pCodes, int32_t iCandidate)
{
    m_pCodes = pCodes;
    m_iCandidate = iCandidate;
    m_uLastSplit = 0;
    std::fill_n(m_auSeen, m_iSplitWords, 0);
    m_match = {MATCH_LIST, 0, UINT16_MAX};
    m_iLength = NameLength(pCodes);
    for (int i = 0; i < m_iLength; ++i)
    {
        m_aiKeys[i] = m_table.KeyOf(pCodes[i]);
    }
    const int iStarts = m_bAnywhere ? m_iLength : 1;
    for (m_iStart = 0; m_iStart < iStarts; ++m_iStart)
    {
        if (m_table.Ends(m_aiKeys[m_iStart], 0) != 0)
        {
            Extend(0, 0, 0, true);
        }
    }
    return m_match;
}

// Lays one more piece, from iOffset on, on the run's character number iPiece.
void CRunFinder::Extend(int iPiece, int iOffset, uint32_t uSplit, bool bAllFull)
{
    const int iKey = m_aiKeys[m_iStart + iPiece];
    const int iInputLen = m_table.InputLength();
    const uint32_t uExtended = uSplit | (1U << (iInputLen - 1 - iOffset));
    for (unsigned uEnds = m_table.Ends(iKey, iOffset); uEnds != 0; uEnds &= uEnds - 1)
    {
        const int iEnd = LowestBit(uEnds);
        const bool bFull = bAllFull && m_table.IsFull(iKey, iOffset, iEnd);
        if (iEnd == iInputLen)
        {
            Record(iPiece + 1, iOffset, uExtended, bFull);
        }
        else if (m_iStart + iPiece + 1 < m_iLength)
        {
            Extend(iPiece + 1, iEnd, uExtended, bFull);
        }
    }
}

void CRunFinder::Record(int iPieces, int iLastOffset, uint32_t uSplit, bool bAllFull)
{
    if (!MarkSeen(uSplit))
    {
        return; // it fitted further left already
    }
    MarkFound(iPieces, iLastOffset, uSplit);
    m_match.uFirstSplit = std::min(m_match.uFirstSplit, static_cast<uint16_t>(uSplit));
    if (uSplit > m_uLastSplit)
    {
        m_uLastSplit = uSplit;
        m_match.iMatchPos = MatchPosition(m_iStart, m_iStart + iPieces - 1);
        m_match.iMatchType = bAllFull ? MATCH_FULL : MATCH_PARTIAL;
        if (iPieces == m_table.InputLength())
        {
            m_match.iMatchType = MATCH_INITIALS;
        }
    }
}

void CRunFinder::MarkFound(int iPieces, int iLastOffset, uint32_t uSplit)
{
    const int iLast = m_iStart + iPieces - 1;
    m_findings.MarkLastPiece(m_aiKeys[iLast], iLastOffset);
    const uint16_t uLastCode = CodeBits(m_pCodes[iLast]);
    if (IsHanZiCode(uLastCode))
    {
        m_findings.NoteCharacter(uSplit, m_iCandidate, uLastCode);
    }
    if (iLast + 1 < m_iLength)
    {
        m_findings.MarkBehindRun(m_aiKeys[iLast + 1]);
    }
}

// False when the split was marked before.
bool CRunFinder::MarkSeen(uint32_t uSplit)
{
    const uint32_t uIndex = uSplit & ((1U << (m_table.InputLength() - 1)) - 1);
    uint64_t& uWord = m_auSeen[uIndex / WORD_BITS];
    const uint64_t uBit = 1ULL << (uIndex % WORD_BITS);
    const bool bNew = (uWord & uBit) == 0;
    uWord |= uBit;
    return bNew;
}
