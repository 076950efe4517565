#include "LocalizerImpl/RunFinder.h"

#include <algorithm>
#include <iterator>

namespace
{

constexpr int WORD_BITS = 64;
constexpr int CANDIDATE_BITS = 32;

int LowestBit(unsigned uBits)
{
    return __builtin_ctz(uBits);
}

} // namespace

// Finds the rows of a name's characters; returns the number of characters where a run may begin.
int CRunFinder::LookUp(const wchar_t* pCodes)
{
    m_iLength = NameLength(pCodes);
    for (int i = 0; i < m_iLength; ++i)
    {
        m_apRows[i] = &m_table.RowOf(pCodes[i]);
    }
    return m_bAnywhere ? m_iLength : std::min(m_iLength, 1);
}

bool CRunFinder::CanMatch(const wchar_t* pCodes)
{
    const int iStarts = m_bAnywhere ? CONTACT_MAX_KEY : 1;
    for (int iStart = 0; iStart < iStarts && pCodes[iStart] != 0; ++iStart)
    {
        const unsigned uFirstEnds = m_table.FirstEnds(pCodes[iStart]);
        if (uFirstEnds != 0 &&
            LeadsToEnd(uFirstEnds, pCodes + iStart + 1, CONTACT_MAX_KEY - iStart - 1))
        {
            return true;
        }
    }
    return false;
}

bool CRunFinder::Find(const wchar_t* pCodes, int32_t iCandidate, tag_NameMatch& match)
{
    if (!CanMatch(pCodes))
    {
        return false;
    }
    const int iStarts = LookUp(pCodes);
    m_iCandidate = iCandidate;
    m_uLastSplit = 0;
    std::fill(std::begin(m_auSeen), std::end(m_auSeen), 0);
    m_match = {MATCH_LIST, 0, UINT16_MAX};
    for (m_iStart = 0; m_iStart < iStarts; ++m_iStart)
    {
        Extend(0, 0, 0, true);
    }
    match = m_match;
    return true;
}

// All splits at once: from the offsets that the pieces before reach, character by character. At
// most iLength codes, fewer when a 0 ends them.
bool CRunFinder::LeadsToEnd(unsigned uReached, const wchar_t* pCodes, int iLength)
{
    const unsigned uEnd = 1U << m_table.InputLength();
    for (int i = 0; (uReached & uEnd) == 0; ++i)
    {
        if (uReached == 0 || i >= iLength || pCodes[i] == 0)
        {
            return false;
        }
        tag_PieceRow& row = m_table.RowOf(pCodes[i]);
        unsigned uNext = 0;
        for (unsigned uOffsets = uReached; uOffsets != 0; uOffsets &= uOffsets - 1)
        {
            uNext |= m_table.Ends(row, LowestBit(uOffsets));
        }
        uReached = uNext;
    }
    return true;
}

// Lays one more piece, from iOffset on, on the run's character number iPiece.
void CRunFinder::Extend(int iPiece, int iOffset, uint32_t uSplit, bool bAllFull)
{
    tag_PieceRow& row = *m_apRows[m_iStart + iPiece];
    const int iInputLen = m_table.InputLength();
    const uint32_t uExtended = uSplit | (1U << (iInputLen - 1 - iOffset));
    for (unsigned uEnds = m_table.Ends(row, iOffset); uEnds != 0; uEnds &= uEnds - 1)
    {
        const int iEnd = LowestBit(uEnds);
        const bool bFull = bAllFull && ((row.auFull[iOffset] >> iEnd) & 1U) != 0;
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
    tag_PieceRow& lastRow = *m_apRows[m_iStart + iPieces - 1];
    lastRow.uLastOffsets = static_cast<uint16_t>(lastRow.uLastOffsets | (1U << iLastOffset));
    const uint64_t uFound =
        (static_cast<uint64_t>(uSplit) << CANDIDATE_BITS) | static_cast<uint32_t>(m_iCandidate);
    lastRow.uFirstFound = std::min(lastRow.uFirstFound, uFound);
    if (m_iStart + iPieces < m_iLength)
    {
        m_apRows[m_iStart + iPieces]->bBehindRun = true;
    }
    m_match.uFirstSplit = std::min(m_match.uFirstSplit, static_cast<uint16_t>(uSplit));
    if (uSplit > m_uLastSplit)
    {
        m_uLastSplit = uSplit;
        m_match.iMatchPos = MatchPosition(m_iStart, iPieces);
        m_match.iMatchType = bAllFull ? MATCH_FULL : MATCH_PARTIAL;
        if (iPieces == m_table.InputLength())
        {
            m_match.iMatchType = MATCH_INITIALS;
        }
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
