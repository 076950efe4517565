#ifndef QV_LOCALIZERIMPL_SEARCHRUN_H
#define QV_LOCALIZERIMPL_SEARCHRUN_H

#include "Core/Records/CandidateFilter.h"
#include "LocalizerImpl/Findings.h"
#include "LocalizerImpl/PieceTable.h"
#include "LocalizerImpl/PinyinTable.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "LocalizerImpl/ReadingSets.h"
#include "LocalizerImpl/RunFinder.h"

#include <optional>

// One search in three steps, for callers that read their candidates while the typed text is known
// already and make room for the result when it is counted. CQVLocalizerManager::DoSearch is all
// three in a row.
//
//   Begin   the text: length, codes, pinyin table; then MayMatch can sort out candidates
//   Find    the matches among the candidates, ranked
//   Finish  the entries, the mask, the candidate characters
class CSearchRun : public CCandidateFilter
{
public:
    // The matcher outlives the run.
    explicit CSearchRun(CQVLocalizerManager& manager);
    ~CSearchRun() override = default;
    CSearchRun(const CSearchRun&) = delete;
    CSearchRun& operator=(const CSearchRun&) = delete;

    // Lowercases szInput and puts codes in place of its Chinese characters. 0; LOC_ERR_PARAM for
    // null or more than 10 characters; LOC_ERR_MAP, also if an allocation fails. After a failure
    // nothing may match.
    int Begin(wchar_t* szInput);

    bool MayMatch(const wchar_t* pCodes) override;

    // After Begin returned 0. An empty text lists all candidates in their order, with time
    // buckets as index characters when bTimeOrder is not 0. Returns the number of matches, or
    // LOC_ERR_MAP if the allocation of the list fails; then the run is over.
    int Find(const tag_LocalizerResult& candidates, int bTimeOrder);

    // Writes the matches of Find into *pResult (null: nowhere; without an array: none), which has
    // room for them, and the rest as DoSearch does.
    void Finish(const tag_LocalizerResult& candidates, tag_LocalizerResult* pResult, long* pMask,
                wchar_t* szWordOut);

    // The same for a caller whose candidates are its own and all of them matches, as after a
    // whole-store search: they become the result where they are, which saves a copy of it.
    void FinishInPlace(tag_LocalizerResult& candidates, long* pMask, wchar_t* szWordOut);

private:
    void RankInPlace(tag_LocalizerDetail* pDetail);
    bool ListAll(const tag_LocalizerResult& candidates, int bTimeOrder);
    bool FindMatches(const tag_LocalizerResult& candidates);
    wchar_t IndexCharacter(const tag_LocalizerDetail& detail, int bTimeOrder);
    void WriteEntries(const tag_LocalizerResult& candidates, tag_LocalizerResult& result) const;

    CQVLocalizerManager& m_manager;
    android::Vector<_MatchResult>& m_vMatches; // the matcher's m_vLocateArray
    int m_iInputLen = 0;
    std::optional<CPinyinTable> m_table; // from Begin on
    CReadingSets::Ptr m_sets;
    std::optional<CPieceTable> m_pieces;
    std::optional<CFindings> m_findings;
    std::optional<CRunFinder> m_finder; // from a successful Begin on
};

#endif
