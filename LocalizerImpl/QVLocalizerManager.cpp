// One search: the typed text against every candidate, the ranked result, the next keys and the
// candidate characters.
//
// Every way to cut the text into pieces is tried on every name, but not one by one: PieceTable
// knows which pieces fit which characters, RunFinder follows them through a name. What a
// successful comparison of a last piece adds to the mask and to the candidate characters is the
// same for every name with that character, so it is collected per character and added at the end,
// in the order in which trying split by split and contact by contact would have met it.

#include "LocalizerImpl/QVLocalizerManager.h"

#include "Common/CommonQsort.h"
#include "Common/Log.h"
#include "Common/WideString.h"
#include "LocalizerImpl/NameFolding.h"
#include "LocalizerImpl/PieceTable.h"
#include "LocalizerImpl/PinyinTable.h"
#include "LocalizerImpl/RankingOrder.h"
#include "LocalizerImpl/RunFinder.h"

#include <algorithm>
#include <cstring>
#include <ctime>
#include <iterator>

namespace
{

constexpr int SPLIT_SHIFT = 32; // a discovery key: split above, candidate below
constexpr int64_t MS_PER_SECOND = 1000;
constexpr int POSITION_BITS = 16; // of iMatchPos: start above, end below
constexpr uint32_t POSITION_MASK = 0xFFFF;

// Characters that the search found first, in order of discovery.
class CFirstFound
{
public:
    void Offer(tag_PieceRow& row)
    {
        tag_PieceRow** ppEnd = m_apRows + m_iCount;
        tag_PieceRow** ppPlace = std::find_if(m_apRows, ppEnd,
                                              [&row](const tag_PieceRow* pRow)
                                              { return row.uFirstFound < pRow->uFirstFound; });
        if (ppPlace - m_apRows == CN_WORD_MAX)
        {
            return;
        }
        std::move_backward(ppPlace, m_apRows + std::min(m_iCount, CN_WORD_MAX - 1),
                           m_apRows + std::min(m_iCount + 1, CN_WORD_MAX));
        *ppPlace = &row;
        m_iCount = std::min(m_iCount + 1, CN_WORD_MAX);
    }

    int Count() const { return m_iCount; }
    tag_PieceRow& At(int i) const { return *m_apRows[i]; }

private:
    tag_PieceRow* m_apRows[CN_WORD_MAX] = {};
    int m_iCount = 0;
};

// Feeds the mask and the candidate characters of a manager from what a search marked.
class CFindingsWriter
{
public:
    CFindingsWriter(CQVLocalizerManager& manager, PYOFWORDS* pMap, _mask_type& mask,
                    CPieceTable& table)
        : m_manager(manager), m_pMap(pMap), m_mask(mask), m_table(table)
    {
    }

    void Write()
    {
        CFirstFound firstFound;
        for (int i = 0; i < m_table.RowCount(); ++i)
        {
            tag_PieceRow& row = m_table.RowAt(i);
            if (row.uFirstFound != CPieceTable::NOT_FOUND && IsHanZiCode(CodeBits(row.code)))
            {
                firstFound.Offer(row);
            }
        }
        for (int i = 0; i < firstFound.Count(); ++i)
        {
            TakeFirstPiece(firstFound.At(i));
        }
        for (int i = 0; i < m_table.RowCount(); ++i)
        {
            TakeOtherPieces(m_table.RowAt(i));
            TakeNextKeys(m_table.RowAt(i));
        }
    }

private:
    void TakeFirstPiece(tag_PieceRow& row)
    {
        const unsigned uSplit = static_cast<unsigned>(row.uFirstFound >> SPLIT_SHIFT);
        TakeLastPiece(row, m_table.InputLength() - 1 - __builtin_ctz(uSplit));
    }

    // The character is listed by now or the list is full: these add to the mask alone.
    void TakeOtherPieces(tag_PieceRow& row)
    {
        for (unsigned uOffsets = row.uLastOffsets; uOffsets != 0; uOffsets &= uOffsets - 1)
        {
            TakeLastPiece(row, __builtin_ctz(uOffsets));
        }
    }

    void TakeLastPiece(tag_PieceRow& row, int iOffset)
    {
        if (IsHanZiCode(CodeBits(row.code)))
        {
            int iFull = 0;
            m_manager.CmpChineseWord(m_pMap, row.code, m_pMap[HanZiRecord(row.code)],
                                     m_table.Piece(iOffset, m_table.InputLength()), &m_mask, 1,
                                     iFull);
        }
    }

    void TakeNextKeys(const tag_PieceRow& row)
    {
        if (row.bBehindRun)
        {
            m_manager.CreateMaskWord(m_pMap, row.code);
        }
    }

    CQVLocalizerManager& m_manager;
    PYOFWORDS* m_pMap;
    _mask_type& m_mask;
    CPieceTable& m_table;
};

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
    _wcslwr(szInput);
    ClearSearch();
    const size_t uInputLen = _wcslen(szInput);
    m_iInputLen = static_cast<int>(std::min<size_t>(uInputLen, LOC_MAX_INPUT + 1));
    if (m_iInputLen > LOC_MAX_INPUT)
    {
        return LOC_ERR_PARAM;
    }
    const CPinyinTable table;
    if (!table.IsOpen())
    {
        return LOC_ERR_MAP;
    }
    if (m_iInputLen > 0)
    {
        ProcessInputCNWord(table.Records(), szInput);
        FindMatches(*pCandidates, table.Records(), szInput);
    }
    else
    {
        ListAll(*pCandidates, table.Records(), bTimeOrder);
    }
    WriteResult(*pCandidates, *pResult);
    *pMask = static_cast<long>(m_stMask.lMask);
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:DoSearch QVLocalizerManger pMask = %x\n", m_stMask.lMask);
    WriteCandidateWords(szWordOut);
    m_vLocateArray.clear();
    return 0;
}

void CQVLocalizerManager::ListAll(const tag_LocalizerResult& candidates, PYOFWORDS* pMap,
                                  int bTimeOrder)
{
    if (bTimeOrder != 0)
    {
        m_llNowMs = static_cast<int64_t>(std::time(nullptr)) * MS_PER_SECOND;
    }
    CPieceTable table(*this, pMap, L"", 0);
    for (int32_t i = 0; candidates.pDetail != nullptr && i < candidates.iResultNum; ++i)
    {
        const tag_LocalizerDetail& detail = candidates.pDetail[i];
        wchar_t szFirstWord[2] = {};
        if (bTimeOrder != 0)
        {
            GetFirstWord(static_cast<long long>(detail.llLastTimeContacted), szFirstWord);
        }
        else
        {
            GetFirstWord(pMap, detail.szLocalizerKey[0], szFirstWord);
        }
        m_vLocateArray.push({i, MATCH_LIST, 0, static_cast<int32_t>(szFirstWord[0])});
        const int iOffered =
            m_bMatchAnywhere != 0 ? NameLength(detail) : std::min(NameLength(detail), 1);
        for (int iCode = 0; iCode < iOffered; ++iCode)
        {
            table.RowOf(detail.szLocalizerKey[iCode]).bBehindRun = true;
        }
    }
    CFindingsWriter(*this, pMap, m_stMask, table).Write();
}

void CQVLocalizerManager::FindMatches(tag_LocalizerResult& candidates, PYOFWORDS* pMap,
                                      wchar_t* szInput)
{
    CPieceTable table(*this, pMap, szInput, m_iInputLen);
    CRunFinder finder(table, m_bMatchAnywhere != 0);
    android::Vector<uint16_t> vFirstSplits; // when each match was first found
    for (int32_t i = 0; candidates.pDetail != nullptr && i < candidates.iResultNum; ++i)
    {
        tag_NameMatch match;
        if (finder.Find(candidates.pDetail[i], i, match) &&
            vFirstSplits.add(match.uFirstSplit) >= 0)
        {
            m_vLocateArray.push({i, match.iMatchType, match.iMatchPos, 0});
        }
    }
    CFindingsWriter(*this, pMap, m_stMask, table).Write();
    const int iMatches = static_cast<int>(m_vLocateArray.size());
    if (iMatches > 1 && RankMatches(m_vLocateArray, vFirstSplits.array(), candidates.pDetail) != 0)
    {
        LocalResultQuickSort(m_vLocateArray, 0, iMatches - 1, candidates.pDetail);
    }
}

void CQVLocalizerManager::WriteResult(const tag_LocalizerResult& candidates,
                                      tag_LocalizerResult& result)
{
    const int iMatches = static_cast<int>(m_vLocateArray.size());
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:DoSearch m_vLocateArray nCount = %d\n", iMatches);
    result.iResultNum = result.pDetail == nullptr ? 0 : iMatches;
    for (int i = 0; i < result.iResultNum; ++i)
    {
        const _MatchResult& match = m_vLocateArray[static_cast<size_t>(i)];
        tag_LocalizerDetail& entry = result.pDetail[i];
        entry = candidates.pDetail[match.iIndex];
        entry.iMatchPos = match.iMatchPos;
        entry.iFirstWord = match.iFirstWord;
    }
}

void CQVLocalizerManager::WriteCandidateWords(wchar_t* szWordOut) const
{
    for (const CNWORDOUTPUT& word : m_stCNWords)
    {
        if (word.wszWord[0] == 0)
        {
            return;
        }
        *szWordOut++ = word.wszWord[0];
    }
}

int CQVLocalizerManager::DoCompare(PYOFWORDS* pMap, tag_LocalizerDetail* pDetail,
                                   android::Vector<wchar_t*>& vPieces, int& iKeyLen, int& bAllFull)
{
    if (pMap == nullptr || pDetail == nullptr)
    {
        return 0;
    }
    const int iLength = NameLength(*pDetail);
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
    if (IsAlpha(uCode))
    {
        return CmpEnglishWords(uCode, szPiece) != 0;
    }
    if (IsHanZi(uCode))
    {
        int bFull = 0;
        const int iFits = CmpChineseWord(pMap, code, pMap[HanZiRecord(code)], szPiece, &m_stMask,
                                         bLast ? 1 : 0, bFull);
        bRunFull = bRunFull != 0 ? bFull : 0;
        return iFits != 0;
    }
    if (IsDigtal(uCode))
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
        if (IsHanZi(CodeBits(szCodes[0])))
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
    if (m_iInputLen == LOC_MAX_INPUT)
    {
        m_stMask = {}; // a full input takes no further key
        return 1;
    }
    if (IsAlpha(CodeBits(code)))
    {
        m_stMask.lMask |= 1U << (CodeBits(code) - LOC_ALPHA_BASE);
    }
    else
    {
        CreateCNWordMask(pMap, code);
    }
    return 1;
}

void CQVLocalizerManager::CreateCNWordMask(PYOFWORDS* pMap, wchar_t code)
{
    if (pMap == nullptr)
    {
        return;
    }
    if (IsHanZi(CodeBits(code)))
    {
        for (const auto& szReading : pMap[HanZiRecord(code)].szPinyin)
        {
            if (szReading[0] >= 'a' && szReading[0] <= 'z')
            {
                m_stMask.lMask |= 1U << (szReading[0] - 'a');
            }
        }
    }
    else if (code == LOC_OTHER || IsDigtal(CodeBits(code)))
    {
        m_stMask.lMask |= MASK_OTHER;
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
    const uint32_t uPos = static_cast<uint32_t>(pDetail->iMatchPos);
    const int iEnd = std::min(static_cast<int>(uPos & POSITION_MASK), CONTACT_MAX_KEY);
    for (int i = static_cast<int>(uPos >> POSITION_BITS); i <= iEnd; ++i)
    {
        const wchar_t code = pDetail->szLocalizerKey[i];
        if (!IsAlpha(CodeBits(code)) && code != LOC_OTHER)
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
        SpellName(sorter, table.Records(), *pRecord);
    }
    return sorter.Search_Bin(reinterpret_cast<char*>(pRecords), iCount,
                             reinterpret_cast<char*>(pRecord), bByTime ? SORT_TIME : SORT_NAME, 1);
}
