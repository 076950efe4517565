#include "LocalizerImpl/QVNumLocalizerManager.h"

#include "Common/Log.h"
#include "LocalizerImpl/MatcherText.h"

#include <algorithm>

namespace
{

constexpr const char* TRACE_TAG = "LocalizerImpl/QVNumLocalizerManager";

constexpr wchar_t KEYS[LOC_ALPHA_COUNT + 1] = L"22233344455566677778889999";

bool CarriesLetters(wchar_t unit)
{
    return unit >= L'2' && unit <= L'9';
}

} // namespace

CQVNumLocalizerManager::CQVNumLocalizerManager(int bMatchAnywhere)
    : CQVLocalizerManager(bMatchAnywhere)
{
}

int CQVNumLocalizerManager::CmpChineseWord(PYOFWORDS* /*pMap*/, wchar_t /*code*/, PYOFWORDS& record,
                                           wchar_t* szPiece, _mask_type* /*pMask*/,
                                           int /*bLastPiece*/, int& bFull)
{
    bFull = 0;
    if (szPiece == nullptr)
    {
        return 0;
    }
    const int iTyped = PieceLength(szPiece);
    int iFits = 0;
    for (const auto& szKeys : record.szPinyinNum)
    {
        if (BeginsSpelling(szPiece, iTyped, szKeys))
        {
            iFits = 1;
            bFull = bFull != 0 || iTyped == SpellingLength(szKeys) ? 1 : 0;
        }
    }
    return iFits;
}

int CQVNumLocalizerManager::CmpEnglishWords(unsigned short code, wchar_t* szPiece)
{
    return IsUnit(szPiece, GetPYNum(L'a' + static_cast<wchar_t>(code - LOC_ALPHA_BASE))) ? 1 : 0;
}

int CQVNumLocalizerManager::CmpOtherWords(unsigned short /*code*/, wchar_t* /*szPiece*/)
{
    return 0;
}

int CQVNumLocalizerManager::CmpDigitalWord(unsigned short code, wchar_t* szPiece)
{
    if (szPiece == nullptr || PieceLength(szPiece) != 1)
    {
        return 0;
    }
    const int iFits = IsUnit(szPiece, L'0' + static_cast<wchar_t>(code - LOC_DIGIT_BASE)) ? 1 : 0;
    QV_LOGD(TRACE_TAG, "QV_Contacts:CQVNumLocalizerManager::CmpDigitalWord r == %d", iFits);
    return iFits;
}

int CQVNumLocalizerManager::IsValid(android::Vector<wchar_t*>& vPieces)
{
    const wchar_t* szPiece = LastPiece(vPieces);
    const int iLength = szPiece == nullptr ? PY_MAX_LETTERS + 1 : PieceLength(szPiece);
    if (iLength > PY_MAX_LETTERS)
    {
        return 0;
    }
    return iLength <= 1 || std::all_of(szPiece, szPiece + iLength, CarriesLetters) ? 1 : 0;
}

wchar_t CQVNumLocalizerManager::GetPYNum(wchar_t unit)
{
    return unit >= L'a' && unit <= L'z' ? KEYS[unit - L'a'] : unit;
}

int CQVNumLocalizerManager::IsNumber(wchar_t unit)
{
    return CarriesLetters(unit) ? 1 : 0;
}
