// One search: the typed text against every candidate, the ranked result, the next keys and the
// candidate characters.
//
// A text passes these classes: CReadingSets maps each character code to a key shared by all
// characters with the same readings; CPieceTable caches which pieces of the text fit which key;
// CReachStates, a lazily built DFA over sets of reachable offsets, rejects the names that do not
// match; CRunFinder works out split, kind and position of those that do, and CFindings what they
// offer next; RankMatches sorts them.

#include "LocalizerImpl/SearchRun.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "Common/WideString.h"
#include "LocalizerImpl/MatchRanking.h"
#include "LocalizerImpl/MatcherText.h"

#include <algorithm>

namespace
{

void LogMatches(size_t uMatches)
{
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:DoSearch m_vLocateArray nCount = %d\n",
            static_cast<int>(uMatches));
}

} // namespace

CSearchRun::CSearchRun(CQVLocalizerManager& manager)
    : m_manager(manager), m_vMatches(manager.m_vLocateArray)
{
}

int CSearchRun::Begin(wchar_t* szInput)
{
    if (szInput == nullptr)
    {
        return LOC_ERR_PARAM;
    }
    m_iInputLen = m_manager.BeginSearch(szInput);
    if (m_iInputLen < 0)
    {
        return m_iInputLen;
    }
    const tag_FileStamp stamp = ReadFileStamp(CDataPaths::PinyinMapping());
    m_table.emplace();
    if (!m_table->IsOpen())
    {
        return LOC_ERR_MAP;
    }
    m_manager.ProcessInputCNWord(m_table->Records(), szInput);
    m_sets = CReadingSets::Of(m_table->Records(), stamp);
    if (m_sets == nullptr)
    {
        return LOC_ERR_MAP;
    }
    m_pieces.emplace(m_manager, *m_sets, szInput, m_iInputLen);
    if (!m_pieces->IsReady())
    {
        return LOC_ERR_MAP;
    }
    m_findings.emplace(*m_pieces);
    m_finder.emplace(*m_pieces, *m_findings, m_manager.m_bMatchAnywhere != 0);
    if (!m_findings->IsReady() || !m_finder->IsReady())
    {
        m_finder.reset();
        return LOC_ERR_MAP;
    }
    return 0;
}

bool CSearchRun::MayMatch(const wchar_t* pCodes)
{
    return m_finder && (m_iInputLen == 0 || m_finder->CanMatch(pCodes));
}

int CSearchRun::Find(const tag_LocalizerResult& candidates, int bTimeOrder)
{
    const bool bFound =
        m_iInputLen == 0 ? ListAll(candidates, bTimeOrder) : FindMatches(candidates);
    if (!bFound)
    {
        m_vMatches.clear();
        return LOC_ERR_MAP;
    }
    m_findings->Report(m_manager);
    return static_cast<int>(m_vMatches.size());
}

bool CSearchRun::ListAll(const tag_LocalizerResult& candidates, int bTimeOrder)
{
    if (bTimeOrder != 0)
    {
        m_manager.ReadClock();
    }
    const int iOffered = m_manager.m_bMatchAnywhere != 0 ? CONTACT_MAX_KEY : 1;
    const int iCount = candidates.pDetail == nullptr ? 0 : candidates.iResultNum;
    if (m_vMatches.setCapacity(static_cast<size_t>(std::max(iCount, 0))) < 0)
    {
        return false;
    }
    for (int32_t i = 0; i < iCount; ++i)
    {
        const tag_LocalizerDetail& detail = candidates.pDetail[i];
        const wchar_t firstWord = IndexCharacter(detail, bTimeOrder);
        m_vMatches.push({i, MATCH_LIST, 0, static_cast<int32_t>(firstWord)});
        const int iCodes = std::min(NameLength(detail.szLocalizerKey), iOffered);
        for (int iCode = 0; iCode < iCodes; ++iCode)
        {
            m_findings->MarkBehindRun(m_pieces->KeyOf(detail.szLocalizerKey[iCode]));
        }
    }
    return true;
}

wchar_t CSearchRun::IndexCharacter(const tag_LocalizerDetail& detail, int bTimeOrder)
{
    if (bTimeOrder == 0)
    {
        const tag_KeyMeaning first = m_sets->MeaningOf(m_sets->KeyOf(detail.szLocalizerKey[0]));
        return CQVLocalizerManager::IndexCharacter(first.code, first.pRecord);
    }
    wchar_t bucket = 0;
    m_manager.GetFirstWord(static_cast<long long>(detail.llLastTimeContacted), &bucket);
    return bucket;
}

bool CSearchRun::FindMatches(const tag_LocalizerResult& candidates)
{
    android::Vector<uint16_t> vFirstSplits; // when each match was first found
    for (int32_t i = 0; candidates.pDetail != nullptr && i < candidates.iResultNum; ++i)
    {
        const wchar_t* pCodes = candidates.pDetail[i].szLocalizerKey;
        // CanMatch is faster than Find, but in vain where most names match, as all do that were
        // selected by MayMatch.
        const bool bRare = m_vMatches.size() < static_cast<size_t>(i) / 2;
        if (bRare && !m_finder->CanMatch(pCodes))
        {
            continue;
        }
        const tag_NameMatch match = m_finder->Find(pCodes, i);
        if (match.uFirstSplit == tag_NameMatch::NO_SPLIT)
        {
            continue;
        }
        if (vFirstSplits.add(match.uFirstSplit) < 0 ||
            m_vMatches.add({i, match.iMatchType, match.iMatchPos, 0}) < 0)
        {
            return false;
        }
    }
    return m_vMatches.size() < 2 ||
           RankMatches(m_vMatches, vFirstSplits.array(), candidates.pDetail) == 0;
}

void CSearchRun::Finish(const tag_LocalizerResult& candidates, tag_LocalizerResult* pResult,
                        long* pMask, wchar_t* szWordOut)
{
    LogMatches(m_vMatches.size());
    if (pResult != nullptr)
    {
        WriteEntries(candidates, *pResult);
    }
    m_manager.EndSearch(pMask, szWordOut);
}

void CSearchRun::FinishInPlace(tag_LocalizerResult& candidates, long* pMask, wchar_t* szWordOut)
{
    LogMatches(m_vMatches.size());
    RankInPlace(candidates.pDetail);
    m_manager.EndSearch(pMask, szWordOut);
}

// Brings entries into the order of their matches along the cycles of the permutation; place k gets
// the entry that match k points to.
void CSearchRun::RankInPlace(tag_LocalizerDetail* pDetail)
{
    const int32_t iCount = static_cast<int32_t>(m_vMatches.size());
    for (int32_t iStart = 0; iStart < iCount; ++iStart)
    {
        if (m_vMatches[static_cast<size_t>(iStart)].iIndex == iStart)
        {
            continue;
        }
        const tag_LocalizerDetail first = pDetail[iStart];
        int32_t iPlace = iStart;
        while (m_vMatches[static_cast<size_t>(iPlace)].iIndex != iPlace)
        {
            _MatchResult& match = m_vMatches.editItemAt(static_cast<size_t>(iPlace));
            const int32_t iFrom = match.iIndex;
            pDetail[iPlace] = iFrom == iStart ? first : pDetail[iFrom];
            match.iIndex = iPlace;
            iPlace = iFrom;
        }
    }
    for (int32_t i = 0; i < iCount; ++i)
    {
        pDetail[i].iMatchPos = m_vMatches[static_cast<size_t>(i)].iMatchPos;
        pDetail[i].iFirstWord = m_vMatches[static_cast<size_t>(i)].iFirstWord;
    }
}

void CSearchRun::WriteEntries(const tag_LocalizerResult& candidates,
                              tag_LocalizerResult& result) const
{
    result.iResultNum = result.pDetail == nullptr ? 0 : static_cast<int32_t>(m_vMatches.size());
    for (int i = 0; i < result.iResultNum; ++i)
    {
        const _MatchResult& match = m_vMatches[static_cast<size_t>(i)];
        tag_LocalizerDetail& entry = result.pDetail[i];
        entry = candidates.pDetail[match.iIndex];
        entry.iMatchPos = match.iMatchPos;
        entry.iFirstWord = match.iFirstWord;
    }
}

int CQVLocalizerManager::DoSearch(tag_LocalizerResult* pCandidates, wchar_t* szInput,
                                  IME_SEARCH_TYPE /*eSearchType*/, int bTimeOrder,
                                  tag_LocalizerResult* pResult, long* pMask, wchar_t* szWordOut)
{
    if (pCandidates == nullptr || szInput == nullptr || pResult == nullptr || pMask == nullptr ||
        szWordOut == nullptr)
    {
        return LOC_ERR_PARAM;
    }
    CSearchRun run(*this);
    const int iRet = run.Begin(szInput);
    if (iRet != 0)
    {
        return iRet;
    }
    const int iFound = run.Find(*pCandidates, bTimeOrder);
    if (iFound < 0)
    {
        return iFound;
    }
    run.Finish(*pCandidates, pResult, pMask, szWordOut);
    return 0;
}
