// One piece against one character, by both matchers, on crafted records.

#include "LocalizerImpl/QVNumLocalizerManager.h"
#include "LocalizerImpl/QVWordLocalizerManager.h"
#include "tests/LocalizerImpl/LocalizerFixture.h"
#include "tests/LocalizerImpl/SearchProbe.h"

#include <gtest/gtest.h>

#include <cstring>
#include <initializer_list>
#include <string>
#include <vector>

namespace
{

using DigitMatcher = LocalizerFixture;
using LetterMatcher = LocalizerFixture;
using NumMatcher = CSearchProbe<CQVNumLocalizerManager>;
using WordMatcher = CSearchProbe<CQVWordLocalizerManager>;

constexpr wchar_t CODE = 0x1234; // of whatever record

// The key of each letter, by the letters of each key.
char KeyOf(char cLetter)
{
    const char* const KEYS[] = {"abc", "def", "ghi", "jkl", "mno", "pqrs", "tuv", "wxyz"};
    int iKey = 2;
    while (std::strchr(KEYS[iKey - 2], cLetter) == nullptr)
    {
        ++iKey;
    }
    return static_cast<char>('0' + iKey);
}

PYOFWORDS RecordOf(std::initializer_list<const char*> readings)
{
    PYOFWORDS record = {};
    std::memcpy(record.szWord, "\xE5\xBC\xA0", 3);
    size_t uSlot = 0;
    for (const char* szReading : readings)
    {
        for (size_t i = 0; szReading[i] != 0; ++i)
        {
            record.szPinyin[uSlot][i] = szReading[i];
            record.szPinyinNum[uSlot][i] = KeyOf(szReading[i]);
        }
        ++uSlot;
    }
    return record;
}

const PYOFWORDS ZHANG = RecordOf({"zhang"});
const PYOFWORDS ZHANG_ZHONG = RecordOf({"zhang", "zhong"});
const PYOFWORDS CHANG_ZHANG = RecordOf({"chang", "", "zhang"}); // an empty slot is no end
const PYOFWORDS XI_XIAN = RecordOf({"xian", "xi", "xiang"});
const PYOFWORDS NO_READING = RecordOf({});

enum FIT
{
    NONE,
    BEGINS,
    WHOLE
};

struct tag_Fit
{
    const PYOFWORDS& record;
    std::wstring strPiece;
    FIT eFit;
};

FIT FitOf(CQVLocalizerManager& matcher, const tag_Fit& row, int bLastPiece = 0)
{
    PYOFWORDS record = row.record;
    std::wstring strPiece = row.strPiece;
    _mask_type mask = {};
    int bFull = 7;
    const int iFits =
        matcher.CmpChineseWord(&record, CODE, record, strPiece.data(), &mask, bLastPiece, bFull);
    EXPECT_TRUE(bFull == 0 || (bFull == 1 && iFits == 1)) << bFull;
    return iFits == 0 ? NONE : bFull == 0 ? BEGINS : WHOLE;
}

int IsValid(CQVLocalizerManager& matcher, std::vector<std::wstring> vTexts)
{
    android::Vector<wchar_t*> vPieces;
    for (std::wstring& strText : vTexts)
    {
        vPieces.push(strText.data());
    }
    return matcher.IsValid(vPieces);
}

// What the matcher finds in the last piece of a text.
Findings Offered(const PYOFWORDS& record, const std::wstring& strPiece, int bLastPiece = 1,
                 int iInputLen = 1)
{
    WordMatcher matcher;
    return matcher.Run(iInputLen, [&] { FitOf(matcher, {record, strPiece, NONE}, bLastPiece); });
}

} // namespace

TEST_F(DigitMatcher, FitsTheBeginningOfAnyReading)
{
    const tag_Fit ROWS[] = {
        {ZHANG, L"9", BEGINS},
        {ZHANG, L"94", BEGINS},
        {ZHANG, L"942", BEGINS},
        {ZHANG, L"9426", BEGINS},
        {ZHANG, L"94264", WHOLE},
        {ZHANG, L"942641", NONE},
        {ZHANG, L"8", NONE},
        {ZHANG, L"9426411111", NONE},
        {ZHANG, L"", BEGINS},
        {ZHANG, L"z", NONE},
        {ZHANG, L"\x139", NONE},
        {ZHANG, L"9\x4E2D", NONE},
        {ZHANG, {CODE}, NONE},
        {CHANG_ZHANG, L"2", BEGINS},
        {CHANG_ZHANG, L"9", BEGINS},
        {CHANG_ZHANG, L"24264", WHOLE},
        {CHANG_ZHANG, L"94264", WHOLE},
        {CHANG_ZHANG, L"92", NONE},
        {XI_XIAN, L"94", WHOLE},
        {XI_XIAN, L"942", BEGINS},
        {NO_READING, L"2", NONE},
        {NO_READING, L"", NONE},
    };
    NumMatcher matcher;
    for (const tag_Fit& row : ROWS)
    {
        const Findings findings = matcher.Run(1,
                                              [&] {
                                                  EXPECT_EQ(FitOf(matcher, row, 1), row.eFit)
                                                      << testing::PrintToString(row.strPiece);
                                              });
        EXPECT_EQ(findings, Findings{}) << "offers nothing";
    }
}

TEST_F(LetterMatcher, FitsTheBeginningOfAnyReadingAndTheCharacterItself)
{
    const tag_Fit ROWS[] = {
        {ZHANG, L"z", BEGINS},
        {ZHANG, L"zhan", BEGINS},
        {ZHANG, L"zhang", WHOLE},
        {ZHANG, L"zhangx", NONE},
        {ZHANG, L"zhangzhang", NONE},
        {ZHANG, L"h", NONE},
        {ZHANG, L"", BEGINS},
        {ZHANG, L"Z", NONE},
        {ZHANG, L"#", NONE},
        {ZHANG, L"9", NONE},
        {ZHANG, L"\x17A", NONE},
        {ZHANG, {CODE}, WHOLE},
        {ZHANG, {CODE + 1}, NONE},
        {ZHANG, {CODE, L'z'}, NONE},
        {ZHANG, {L'z', CODE}, NONE},
        {ZHANG, {CODE, CODE}, NONE},
        {CHANG_ZHANG, L"c", BEGINS},
        {CHANG_ZHANG, L"zh", BEGINS},
        {CHANG_ZHANG, L"chang", WHOLE},
        {CHANG_ZHANG, L"zhang", WHOLE},
        {XI_XIAN, L"xi", WHOLE},
        {XI_XIAN, L"xia", BEGINS},
        {NO_READING, L"a", NONE},
        {NO_READING, {CODE}, WHOLE},
    };
    CQVWordLocalizerManager matcher(1);
    for (const tag_Fit& row : ROWS)
    {
        EXPECT_EQ(FitOf(matcher, row), row.eFit) << testing::PrintToString(row.strPiece);
        EXPECT_EQ(FitOf(matcher, row, 1), row.eFit) << testing::PrintToString(row.strPiece);
    }
}

TEST_F(LetterMatcher, OffersTheNextLetterAndTheCharacterForALastPiece)
{
    EXPECT_EQ(Offered(ZHANG_ZHONG, L"zh"), (Findings{"ao", L"张"})) << "listed once";
    EXPECT_EQ(Offered(ZHANG_ZHONG, L"zh", 0), Findings{}) << "not the last piece";
    EXPECT_EQ(Offered(ZHANG_ZHONG, L"zho"), (Findings{"n", L"张"}));
    EXPECT_EQ(Offered(ZHANG_ZHONG, L"zhang"), (Findings{"", L"张"}));
    EXPECT_EQ(Offered(XI_XIAN, L"xi"), (Findings{"a", L"张"}));
    EXPECT_EQ(Offered(CHANG_ZHANG, L""), (Findings{"cz", L""})) << "for no letter typed";
    EXPECT_EQ(Offered(ZHANG, {CODE}), Findings{}) << "it stands there already";
    EXPECT_EQ(Offered(ZHANG, L"x"), Findings{});
    EXPECT_EQ(Offered(ZHANG, L"zh", 1, 9), (Findings{"a", L"张"}));
    EXPECT_EQ(Offered(ZHANG, L"zh", 1, 10), (Findings{"", L"张"})) << "no key fits in";
}

TEST(Matchers, FitLettersByOneCharacter)
{
    CQVNumLocalizerManager digits(1);
    CQVWordLocalizerManager letters(1);
    for (wchar_t unit = 1; unit < 0x180; ++unit)
    {
        for (int k = 0; k < 26; ++k)
        {
            wchar_t szPiece[] = {unit, 0, 0};
            const auto code = static_cast<unsigned short>(0x4F00 + k);
            const bool bKey = unit == KeyOf(static_cast<char>('a' + k));
            ASSERT_EQ(digits.CmpEnglishWords(code, szPiece), bKey ? 1 : 0) << k;
            ASSERT_EQ(letters.CmpEnglishWords(code, szPiece), unit == L'a' + k ? 1 : 0) << k;
            szPiece[1] = unit;
            ASSERT_EQ(digits.CmpEnglishWords(code, szPiece), 0);
            ASSERT_EQ(letters.CmpEnglishWords(code, szPiece), 0);
        }
        const bool bLowercase = unit >= L'a' && unit <= L'z';
        EXPECT_EQ(digits.GetPYNum(unit), bLowercase ? KeyOf(static_cast<char>(unit)) : unit);
        EXPECT_EQ(digits.IsNumber(unit), unit >= L'2' && unit <= L'9' ? 1 : 0);
    }
}

TEST(Matchers, FitDigitsAndOtherCharacters)
{
    CQVNumLocalizerManager digits(1);
    CQVWordLocalizerManager letters(1);
    const CLogCapture log;
    std::vector<tag_LogLine> vExpected;
    for (int d = 0; d < 10; ++d)
    {
        const auto code = static_cast<unsigned short>(0x5A00 + d);
        for (std::wstring strPiece : {L"", L"0", L"7", L"9", L"#", L"a", L"\x137", L"77", L"##"})
        {
            const bool bSame = strPiece == std::to_wstring(d);
            EXPECT_EQ(digits.CmpDigitalWord(code, strPiece.data()), bSame ? 1 : 0);
            EXPECT_EQ(letters.CmpDigitalWord(code, strPiece.data()),
                      bSame || strPiece == L"#" ? 1 : 0);
            EXPECT_EQ(letters.CmpOtherWords(0x5000, strPiece.data()), strPiece == L"#" ? 1 : 0);
            EXPECT_EQ(letters.CmpOtherWords(0x5001, strPiece.data()), 0);
            EXPECT_EQ(digits.CmpOtherWords(0x5000, strPiece.data()), 0);
            if (strPiece.size() == 1)
            {
                vExpected.push_back(
                    {3, "LocalizerImpl/QVNumLocalizerManager",
                     std::string("QV_Contacts:CQVNumLocalizerManager::CmpDigitalWord r == ") +
                         (bSame ? "1" : "0")});
            }
        }
    }
    for (CQVLocalizerManager* pMatcher :
         {static_cast<CQVLocalizerManager*>(&digits), static_cast<CQVLocalizerManager*>(&letters)})
    {
        PYOFWORDS record = ZHANG;
        _mask_type mask = {};
        int bFull = 1;
        EXPECT_EQ(pMatcher->CmpChineseWord(&record, CODE, record, nullptr, &mask, 1, bFull), 0);
        EXPECT_EQ(pMatcher->CmpEnglishWords(0x4F00, nullptr), 0);
        EXPECT_EQ(pMatcher->CmpDigitalWord(0x5A00, nullptr), 0);
        EXPECT_EQ(pMatcher->CmpOtherWords(0x5000, nullptr), 0);
    }
    EXPECT_EQ(log.Lines(), vExpected);
}

TEST(Matchers, TryASplitWhenItsLastPieceMayFit)
{
    CQVNumLocalizerManager digits(1);
    CQVWordLocalizerManager letters(1);
    const struct
    {
        std::wstring strLast;
        int bDigits;
        int bLetters;
    } ROWS[] = {{L"", 1, 1},        {L"x", 1, 1},       {L"#", 1, 1},          {L"1", 1, 1},
                {L"23", 1, 0},      {L"942646", 1, 0},  {L"21", 0, 0},         {L"2#", 0, 0},
                {L"9426469", 0, 0}, {L"zh", 0, 1},      {L"zhuang", 0, 1},     {L"zx", 0, 0},
                {L"z2", 0, 0},      {L"zhuangx", 0, 0}, {L"zhuangzhua", 0, 0}, {L"ZH", 0, 0},
                {L"x\x1234", 0, 0}, {L"20", 0, 0},      {L"2:", 0, 0},         {{CODE}, 1, 1}};
    for (const auto& row : ROWS)
    {
        EXPECT_EQ(IsValid(digits, {row.strLast, L"?!"}), row.bDigits)
            << testing::PrintToString(row.strLast);
        EXPECT_EQ(IsValid(letters, {row.strLast, L"?!"}), row.bLetters)
            << testing::PrintToString(row.strLast);
    }
    android::Vector<wchar_t*> vNull;
    vNull.push(nullptr);
    for (CQVLocalizerManager* pMatcher :
         {static_cast<CQVLocalizerManager*>(&digits), static_cast<CQVLocalizerManager*>(&letters)})
    {
        EXPECT_EQ(IsValid(*pMatcher, {}), 0);
        EXPECT_EQ(pMatcher->IsValid(vNull), 0);
    }
}
