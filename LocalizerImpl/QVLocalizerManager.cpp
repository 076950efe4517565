// The state of a search and what matchers add to it.

#include "LocalizerImpl/QVLocalizerManager.h"

#include "Common/Log.h"
#include "Common/WideString.h"
#include "LocalizerImpl/NameFolding.h"

#include <algorithm>
#include <climits>
#include <ctime>
#include <iterator>

namespace
{

constexpr int64_t MS_PER_SECOND = 1000;

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

int CQVLocalizerManager::BeginSearch(wchar_t* szInput)
{
    _wcslwr(szInput);
    m_stMask = {};
    std::fill(std::begin(m_stCNWords), std::end(m_stCNWords), CNWORDOUTPUT{});
    m_vLocateArray.clear();
    m_iInputLen = static_cast<int>(std::min<size_t>(_wcslen(szInput), INT_MAX));
    return m_iInputLen <= LOC_MAX_INPUT ? m_iInputLen : LOC_ERR_PARAM;
}

// Without a code: a typed character adds nothing as a last piece.
void CQVLocalizerManager::OfferLastPiece(PYOFWORDS* pMap, PYOFWORDS& record, wchar_t* szPiece)
{
    int iFull = 0;
    CmpChineseWord(pMap, LOC_NO_CODE, record, szPiece, &m_stMask, 1, iFull);
}

void CQVLocalizerManager::ReadClock()
{
    m_llNowMs = static_cast<int64_t>(std::time(nullptr)) * MS_PER_SECOND;
}

void CQVLocalizerManager::EndSearch(long* pMask, wchar_t* szWordOut)
{
    *pMask = static_cast<long>(m_stMask.lMask);
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:DoSearch QVLocalizerManger pMask = %x\n", m_stMask.lMask);
    const CNWORDOUTPUT* pWord = std::begin(m_stCNWords);
    for (; pWord != std::end(m_stCNWords) && pWord->wszWord[0] != 0; ++pWord)
    {
        *szWordOut++ = pWord->wszWord[0];
    }
    m_vLocateArray.clear();
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
