#include "LocalizerImpl/QVWordLocalizerManager.h"

#include "LocalizerImpl/MatcherText.h"

#include <algorithm>

namespace
{

constexpr wchar_t ANY_KEY = L'#'; // stands for any digit or other character

bool IsAllLetters(const wchar_t* szPiece, int iLength)
{
    return std::all_of(szPiece, szPiece + iLength, CQVLocalizerManager::IsEnglishWord);
}

} // namespace

CQVWordLocalizerManager::CQVWordLocalizerManager(int bMatchAnywhere)
    : CQVLocalizerManager(bMatchAnywhere)
{
}

int CQVWordLocalizerManager::CmpChineseWord(PYOFWORDS* pMap, wchar_t code, PYOFWORDS& record,
                                            wchar_t* szPiece, _mask_type* /*pMask*/, int bLastPiece,
                                            int& bFull)
{
    bFull = 0;
    if (szPiece == nullptr)
    {
        return 0;
    }
    if (IsUnit(szPiece, code))
    {
        bFull = 1;
        return 1;
    }
    const int iTyped = PieceLength(szPiece);
    if (!IsAllLetters(szPiece, iTyped))
    {
        return 0;
    }
    int iFits = 0;
    for (const auto& szReading : record.szPinyin)
    {
        if (!BeginsSpelling(szPiece, iTyped, szReading))
        {
            continue;
        }
        iFits = 1;
        const int iLength = SpellingLength(szReading);
        if (bLastPiece != 0)
        {
            OfferReading(pMap, record, szReading, iLength, iTyped);
        }
        if (iTyped == iLength)
        {
            bFull = 1;
        }
    }
    return iFits;
}

// The letter behind the typed ones as a key, the character as a candidate.
void CQVWordLocalizerManager::OfferReading(PYOFWORDS* pMap, const PYOFWORDS& record,
                                           const char* szReading, int iLength, int iTyped)
{
    if (iLength > iTyped)
    {
        CreateMaskWord(pMap, LOC_ALPHA_BASE + static_cast<wchar_t>(szReading[iTyped] - 'a'));
    }
    if (iTyped != 0)
    {
        CNWORDOUTPUT candidate = {};
        candidate.wszWord[0] = RecordCharacter(record);
        candidate.nMatchLen = static_cast<uint16_t>(iTyped);
        InsertCNWord(candidate);
    }
}

int CQVWordLocalizerManager::CmpEnglishWords(unsigned short code, wchar_t* szPiece)
{
    return IsUnit(szPiece, L'a' + static_cast<wchar_t>(code - LOC_ALPHA_BASE)) ? 1 : 0;
}

int CQVWordLocalizerManager::CmpOtherWords(unsigned short code, wchar_t* szPiece)
{
    return code == LOC_OTHER && IsUnit(szPiece, ANY_KEY) ? 1 : 0;
}

int CQVWordLocalizerManager::CmpDigitalWord(unsigned short code, wchar_t* szPiece)
{
    const wchar_t digit = L'0' + static_cast<wchar_t>(code - LOC_DIGIT_BASE);
    return IsUnit(szPiece, ANY_KEY) || IsUnit(szPiece, digit) ? 1 : 0;
}

int CQVWordLocalizerManager::IsValid(android::Vector<wchar_t*>& vPieces)
{
    wchar_t* szPiece = LastPiece(vPieces);
    const int iLength = szPiece == nullptr ? PY_MAX_LETTERS + 1 : PieceLength(szPiece);
    if (iLength > PY_MAX_LETTERS)
    {
        return 0;
    }
    return iLength <= 1 || (IsAllLetters(szPiece, iLength) && IsPyWords(szPiece)) ? 1 : 0;
}
