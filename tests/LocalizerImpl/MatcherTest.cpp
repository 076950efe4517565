// One piece against one character, by both matchers.

#include "LocalizerImpl/QVNumLocalizerManager.h"
#include "LocalizerImpl/QVWordLocalizerManager.h"
#include "tests/LocalizerImpl/LocalizerFixture.h"

#include <vector>

namespace
{

constexpr wchar_t CODE = 0x1234; // of whatever record

// An empty slot is no end of the readings.
constexpr PYOFWORDS CHANG_ZHANG = {"张", {"chang", "", "zhang"}, {"24264", "", "94264"}};
constexpr PYOFWORDS NO_READING = {"张", {}, {}};

struct tag_Fit
{
    bool bDigits;
    const PYOFWORDS& record;
    std::wstring strPiece;
    std::pair<int, int> expected; // whether it fits, whether as a whole
};

const std::pair NONE = {0, 0};
const std::pair BEGINS = {1, 0};
const std::pair WHOLE = {1, 1};

} // namespace

TEST(Matchers, FitTheBeginningOfAnyReading)
{
    const tag_Fit ROWS[] = {
        {true, CHANG_ZHANG, L"94264", WHOLE}, {true, CHANG_ZHANG, L"92", NONE},
        {true, NO_READING, L"", NONE},        {false, CHANG_ZHANG, L"zh", BEGINS},
        {false, NO_READING, {CODE}, WHOLE},   {false, CHANG_ZHANG, {CODE, 1}, NONE}};
    CQVNumLocalizerManager digits(1);
    CQVWordLocalizerManager letters(1);
    for (const tag_Fit& row : ROWS)
    {
        CQVLocalizerManager& matcher =
            row.bDigits ? static_cast<CQVLocalizerManager&>(digits) : letters;
        PYOFWORDS record = row.record;
        std::wstring strPiece = row.strPiece;
        _mask_type mask = {};
        int bFull = 7;
        const int iFits =
            matcher.CmpChineseWord(&record, CODE, record, strPiece.data(), &mask, 0, bFull);
        EXPECT_EQ(std::pair(iFits, bFull), row.expected) << testing::PrintToString(strPiece);
    }
}

TEST(Matchers, FitDigitsAndOtherCharacters)
{
    CQVNumLocalizerManager digits(1);
    CQVWordLocalizerManager letters(1);
    const CLogCapture log;
    std::vector<tag_LogLine> vExpected;
    for (std::wstring strPiece : {L"", L"7", L"9", L"#", L"a", L"\x137", L"77", L"##"})
    {
        const int bSame = strPiece == L"7" ? 1 : 0;
        const int bOther = strPiece == L"#" ? 1 : 0;
        EXPECT_EQ(digits.CmpDigitalWord(0x5A07, strPiece.data()), bSame);
        EXPECT_EQ(letters.CmpDigitalWord(0x5A07, strPiece.data()), bSame | bOther);
        EXPECT_EQ(letters.CmpOtherWords(0x5000, strPiece.data()), bOther);
        EXPECT_EQ(digits.CmpOtherWords(0x5000, strPiece.data()), 0);
        if (strPiece.size() == 1)
        {
            vExpected.push_back(
                {DEBUG_LINE, "LocalizerImpl/QVNumLocalizerManager",
                 std::string("QV_Contacts:CQVNumLocalizerManager::CmpDigitalWord r == ") +
                     std::to_string(bSame)});
        }
    }
    EXPECT_EQ(log.Lines(), vExpected);
}
