// The object of one search: its state, and the comparisons it is made of, one by one. How they are
// put together for a whole search is told in SearchRun.cpp.

#include "LocalizerImpl/QVLocalizerManager.h"

#include "Common/CommonQsort.h"
#include "Common/WideString.h"
#include "LocalizerImpl/NameFolding.h"
#include "LocalizerImpl/PinyinTable.h"
#include "LocalizerImpl/RunFinder.h"
#include "LocalizerImpl/SearchRun.h"

#include <algorithm>
#include <iterator>

namespace
{

const PYOFWORDS* RecordOrNull(const PYOFWORDS* pMap, wchar_t code)
{
    return IsHanZiCode(CodeBits(code)) ? pMap + HanZiRecord(code) : nullptr;
}

// The mask of the keys that type a character which is no letter.
uint32_t InitialsOf(wchar_t code, const PYOFWORDS* pRecord)
{
    if (pRecord == nullptr)
    {
        return code == LOC_OTHER || IsDigitCode(CodeBits(code)) ? MASK_OTHER : 0;
    }
    uint32_t uMask = 0;
    for (const auto& szReading : pRecord->szPinyin)
    {
        if (szReading[0] >= 'a' && szReading[0] <= 'z')
        {
            uMask |= 1U << (szReading[0] - 'a');
        }
    }
    return uMask;
}

} // namespace

CQVLocalizerManager::CQVLocalizerManager(int bMatchAnywhere)
    : m_stCNWords{}, m_iInputLen(0), m_stMask{}, m_bMatchAnywhere(bMatchAnywhere), m_llNowMs(0)
{
}

CQVLocalizerManager::~CQVLocalizerManager()
{
    m_vLocateArray.clear();
}

void CQVLocalizerManager::ClearSearch()
{
    m_stMask = {};
    std::fill(std::begin(m_stCNWords), std::end(m_stCNWords), CNWORDOUTPUT{});
    m_vLocateArray.clear();
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

void CQVLocalizerManager::ProcessInputCNWord(PYOFWORDS* pMap, wchar_t* szInput)
{
    if (pMap == nullptr || szInput == nullptr)
    {
        return;
    }
    for (wchar_t* pUnit = szInput; *pUnit != 0; ++pUnit)
    {
        if (IsEnglishWord(*pUnit) || IsDigitalChar(*pUnit))
        {
            continue;
        }
        wchar_t szCharacter[] = {*pUnit, 0};
        Ft2Jt(szCharacter);
        wchar_t szCodes[CONTACT_MAX_KEY] = {};
        TranslateNameToLocal(pMap, szCharacter, szCodes);
        if (IsHanZiCode(CodeBits(szCodes[0])))
        {
            *pUnit = szCodes[0];
        }
    }
}

int CQVLocalizerManager::CreateMaskWord(PYOFWORDS* pMap, wchar_t code)
{
    if (pMap == nullptr)
    {
        return 0;
    }
    AddNextKey(code, RecordOrNull(pMap, code));
    return 1;
}

void CQVLocalizerManager::AddNextKey(wchar_t code, const PYOFWORDS* pRecord)
{
    if (m_iInputLen == LOC_MAX_INPUT)
    {
        m_stMask = {}; // a full input takes no further key
    }
    else if (IsAlphaCode(CodeBits(code)))
    {
        m_stMask.lMask |= 1U << (CodeBits(code) - LOC_ALPHA_BASE);
    }
    else
    {
        m_stMask.lMask |= InitialsOf(code, pRecord);
    }
}

void CQVLocalizerManager::CreateCNWordMask(PYOFWORDS* pMap, wchar_t code)
{
    if (pMap != nullptr)
    {
        m_stMask.lMask |= InitialsOf(code, RecordOrNull(pMap, code));
    }
}

void CQVLocalizerManager::InsertCNWord(CNWORDOUTPUT& entry)
{
    if (entry.nMatchLen == 0)
    {
        return;
    }
    for (CNWORDOUTPUT& slot : m_stCNWords)
    {
        if (slot.wszWord[0] == 0)
        {
            slot = entry;
            return;
        }
        if (_wcscmp(slot.wszWord, entry.wszWord) == 0)
        {
            return;
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
