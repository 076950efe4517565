#ifndef QV_LOCALIZERIMPL_RUNFINDER_H
#define QV_LOCALIZERIMPL_RUNFINDER_H

#include "LocalizerImpl/Findings.h"
#include "LocalizerImpl/PieceTable.h"
#include "LocalizerImpl/ReachStates.h"

#include <cstdint>

// Finds the runs of a name's characters that a typed text spells, one piece per character.
//
// A split of a text of n characters is a number: bit b stands for a piece that begins at
// character n - 1 - b, so bit n - 1 is always set. Larger numbers are tried later. Each split
// counts at the leftmost character where it fits, and the largest split that fits anywhere
// decides how the name matches.

// How a name matches.
struct tag_NameMatch
{
    static constexpr uint16_t NO_SPLIT = UINT16_MAX;

    int32_t iMatchType;
    int32_t iMatchPos;
    uint16_t uFirstSplit; // the smallest split that fits: when the name was found; or NO_SPLIT
};

class CRunFinder
{
public:
    // bAnywhere false: runs begin at a name's first character only. The table and the findings
    // outlive the object.
    CRunFinder(CPieceTable& table, CFindings& findings, bool bAnywhere);

    // False if the allocation failed; then nothing else may be called.
    bool IsReady() const { return m_states.IsReady(); }

    // Whether the text spells a run of the name with these CONTACT_MAX_KEY codes, of which those
    // from the first LOC_NO_CODE on do not count.
    bool CanMatch(const wchar_t* pCodes) { return m_states.Accept(pCodes); }

    // How a name matches, if it does. The findings get the characters that took a last piece, as
    // those of candidate iCandidate, and those behind a run.
    tag_NameMatch Find(const wchar_t* pCodes, int32_t iCandidate);

private:
    static constexpr int WORD_BITS = 64;
    static constexpr int SPLIT_WORDS = (1 << (LOC_MAX_INPUT - 1)) / WORD_BITS;

    void Extend(int iPiece, int iOffset, uint32_t uSplit, bool bAllFull);
    void Record(int iPieces, int iLastOffset, uint32_t uSplit, bool bAllFull);
    void MarkFound(int iPieces, int iLastOffset, uint32_t uSplit);
    bool MarkSeen(uint32_t uSplit);

    CPieceTable& m_table;
    CFindings& m_findings;
    CReachStates m_states;
    bool m_bAnywhere;
    int m_iSplitWords; // of m_auSeen that the text's splits need
    const wchar_t* m_pCodes = nullptr;
    int m_aiKeys[CONTACT_MAX_KEY] = {};
    int m_iLength = 0;
    int m_iStart = 0;
    int32_t m_iCandidate = 0;
    uint32_t m_uLastSplit = 0;
    uint64_t m_auSeen[SPLIT_WORDS] = {};
    tag_NameMatch m_match = {};
};

#endif
