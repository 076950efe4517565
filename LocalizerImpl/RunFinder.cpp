#include "LocalizerImpl/RunFinder.h"

#include "LocalizerImpl/MatcherText.h"

#include <algorithm>
#include <iterator>

namespace
{

constexpr unsigned FIRST_OFFSET = 1;

int LowestBit(unsigned uBits)
{
    return __builtin_ctz(uBits);
}

bool HasBit(unsigned uBits, int iBit)
{
    return ((uBits >> iBit) & 1U) != 0;
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
    m_match = {MATCH_LIST, 0, tag_NameMatch::NO_SPLIT};
    m_iLength = NameLength(pCodes);
    for (int i = 0; i < m_iLength; ++i)
    {
        m_aiKeys[i] = m_table.KeyOf(pCodes[i]);
    }
    const int iStarts = m_bAnywhere ? m_iLength : std::min(m_iLength, 1);
    for (m_iStart = 0; m_iStart < iStarts; ++m_iStart)
    {
        if ((m_table.DeadOffsets(m_aiKeys[m_iStart]) & FIRST_OFFSET) == 0)
        {
            Extend(0, 0, 0, true);
        }
    }
    return m_match;
}

// Lays one more piece, from iOffset on, on the run's character number iPiece.
void CRunFinder::Extend(int iPiece, int iOffset, uint32_t uSplit, bool bAllFull)
{
    const int iInputLen = m_table.InputLength();
    const int iPlace = m_iStart + iPiece;
    const unsigned uEnds = m_table.Ends(m_aiKeys[iPlace], iOffset);
    const unsigned uFull = bAllFull ? m_table.FullEnds(m_aiKeys[iPlace], iOffset) : 0;
    const uint32_t uExtended = uSplit | (1U << (iInputLen - 1 - iOffset));
    if (HasBit(uEnds, iInputLen))
    {
        Record(iPiece + 1, iOffset, uExtended, HasBit(uFull, iInputLen));
    }
    if (iPlace + 1 == m_iLength)
    {
        return;
    }
    const unsigned uInner = uEnds & ((1U << iInputLen) - 1);
    for (unsigned uGoOn = uInner & ~m_table.DeadOffsets(m_aiKeys[iPlace + 1]); uGoOn != 0;
         uGoOn &= uGoOn - 1)
    {
        const int iEnd = LowestBit(uGoOn);
        Extend(iPiece + 1, iEnd, uExtended, HasBit(uFull, iEnd));
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
