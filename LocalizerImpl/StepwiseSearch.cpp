// A search step by step, for callers outside: one split against one name, one match after the
// other, then the sort. SearchRun.cpp finds the same in one go, and is tested against this.

#include "Common/CommonQsort.h"
#include "LocalizerImpl/MatchRanking.h"
#include "LocalizerImpl/MatcherText.h"
#include "LocalizerImpl/PinyinTable.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "LocalizerImpl/StepQuickSort.h"

#include <algorithm>

int CQVLocalizerManager::DoCompare(PYOFWORDS* pMap, tag_LocalizerDetail* pDetail,
                                   android::Vector<wchar_t*>& vPieces, int& iKeyLen, int& bAllFull)
{
    if (pMap == nullptr || pDetail == nullptr)
    {
        return 0;
    }
    const int iLength = NameLength(pDetail->szLocalizerKey);
    const int iPieces = static_cast<int>(vPieces.size());
    for (int iStart = 0; iStart + iPieces <= iLength; ++iStart)
    {
        int bRunFull = 1;
        if (CompareRun(pMap, pDetail->szLocalizerKey + iStart, vPieces, bRunFull))
        {
            if (iKeyLen == 0 || (bRunFull == 1 && bAllFull == 0))
            {
                iKeyLen = iLength - iStart;
            }
            if (bAllFull == 0 && bRunFull == 1)
            {
                bAllFull = 1;
            }
            if (iStart + iPieces < iLength)
            {
                CreateMaskWord(pMap, pDetail->szLocalizerKey[iStart + iPieces]);
            }
            return 1;
        }
        if (m_bMatchAnywhere == 0)
        {
            return 0;
        }
    }
    return 0;
}

// Whether every piece fits its character of the run; bRunFull becomes 0 when a Chinese character
// took less than a whole reading.
bool CQVLocalizerManager::CompareRun(PYOFWORDS* pMap, const wchar_t* pCodes,
                                     const android::Vector<wchar_t*>& vPieces, int& bRunFull)
{
    const size_t uPieces = vPieces.size();
    for (size_t i = 0; i < uPieces; ++i)
    {
        const bool bLast = i + 1 == uPieces;
        wchar_t* szPiece = vPieces[uPieces - 1 - i];
        if (szPiece == nullptr || !ComparePiece(pMap, pCodes[i], szPiece, bLast, bRunFull))
        {
            return false;
        }
    }
    return true;
}

bool CQVLocalizerManager::ComparePiece(PYOFWORDS* pMap, wchar_t code, wchar_t* szPiece, bool bLast,
                                       int& bRunFull)
{
    const uint16_t uCode = CodeBits(code);
    if (IsAlphaCode(uCode))
    {
        return CmpEnglishWords(uCode, szPiece) != 0;
    }
    if (IsHanZiCode(uCode))
    {
        int bFull = 0;
        const int iFits = CmpChineseWord(pMap, code, pMap[HanZiRecord(code)], szPiece, &m_stMask,
                                         bLast ? 1 : 0, bFull);
        bRunFull = bRunFull != 0 ? bFull : 0;
        return iFits != 0;
    }
    if (IsDigitCode(uCode))
    {
        return CmpDigitalWord(uCode, szPiece) != 0;
    }
    return CmpOtherWords(uCode, szPiece) != 0;
}

int CQVLocalizerManager::AddToVector(android::Vector<_MatchResult>& vMatches, _MatchResult match)
{
    for (size_t i = 0; i < vMatches.size(); ++i)
    {
        if (vMatches[i].iIndex == match.iIndex)
        {
            vMatches.replaceAt(match, i);
            return 0;
        }
    }
    vMatches.push(match);
    return 0;
}

int CQVLocalizerManager::LocalResultQuickSort(android::Vector<_MatchResult>& vMatches, int iLow,
                                              int iHigh, tag_LocalizerDetail* pDetail)
{
    QuickSort(vMatches.editArray(), iLow, iHigh,
              [pDetail](const _MatchResult& a, const _MatchResult& b)
              { return CompareMatches(a, b, pDetail); });
    return 1;
}

void CQVLocalizerManager::LocalResultQuickSort(android::Vector<_MatchResult>& vMatches,
                                               tag_LocalizerDetail* pDetail)
{
    for (size_t i = 0; i < vMatches.size(); ++i)
    {
        for (size_t j = i; j < vMatches.size(); ++j)
        {
            if (CompareMatches(vMatches[j], vMatches[i], pDetail) < 0)
            {
                const _MatchResult earlier = vMatches[j];
                vMatches.replaceAt(_MatchResult(vMatches[i]), j);
                vMatches.replaceAt(earlier, i);
            }
        }
    }
}

int CQVLocalizerManager::JudgeAllEnglish(tag_LocalizerDetail* pDetail)
{
    if (pDetail == nullptr)
    {
        return 0;
    }
    const int iLast = std::min(MatchLast(pDetail->iMatchPos), CONTACT_MAX_KEY);
    for (int i = MatchFirst(pDetail->iMatchPos); i <= iLast; ++i)
    {
        const wchar_t code = pDetail->szLocalizerKey[i];
        if (!IsAlphaCode(CodeBits(code)) && code != LOC_OTHER)
        {
            return 0;
        }
    }
    return 1;
}

int CQVLocalizerManager::LocalizerSearchPos(tag_ContactsStruct* pRecords, int iCount,
                                            tag_ContactsStruct* pRecord, int iSortType)
{
    if (pRecords == nullptr || pRecord == nullptr)
    {
        return -1;
    }
    const bool bByTime = iSortType == STORE_ORDER_TIME;
    Common_Qsort sorter;
    if (!bByTime)
    {
        const CPinyinTable table;
        if (!table.IsOpen())
        {
            return -1;
        }
        SpellName(table.Records(), *pRecord);
    }
    return sorter.Search_Bin(reinterpret_cast<char*>(pRecords), iCount,
                             reinterpret_cast<char*>(pRecord), bByTime ? SORT_TIME : SORT_NAME, 1);
}
