// The search against its own operations, called split by split and name by name: every short text
// over a small alphabet, long texts over many names, narrowed and not. The operations themselves
// are held by tables.

#include "LocalizerImpl/QVNumLocalizerManager.h"
#include "LocalizerImpl/QVWordLocalizerManager.h"
#include "tests/LocalizerImpl/LocalizerFixture.h"
#include "tests/Support/StoreImage.h"

#include <algorithm>
#include <pthread.h>
#include <random>
#include <sstream>
#include <thread>
#include <tuple>

namespace
{

using Manager = CQVLocalizerManager;
using Details = std::vector<tag_LocalizerDetail>;
using Pieces = std::vector<std::wstring>;

// What one comparison answers: whether it matched, iKeyLen and bAllFull.
using Compared = std::tuple<int, int, int>;

constexpr wchar_t DAMAGED_CODE = 0x6FFF;

// What a search answers.
struct tag_Answer
{
    Details vEntries;
    uint32_t uMask;
    std::wstring strWords;
};

tag_LocalizerDetail MakeDetail(int iId, int iPlace, const std::wstring& strCodes)
{
    tag_LocalizerDetail detail = {};
    detail.iContactID = iId;
    detail.iSortIndex = iPlace;
    std::copy_n(strCodes.begin(), std::min<size_t>(strCodes.size(), 10), detail.szLocalizerKey);
    return detail;
}

void FillLastFirst(Pieces& vPieces, android::Vector<wchar_t*>& vLastFirst)
{
    std::for_each(vPieces.rbegin(), vPieces.rend(),
                  [&](std::wstring& strPiece) { vLastFirst.push(strPiece.data()); });
}

// One search made of the operations of its matcher.
template <class TMatcher>
class CStepwise : public TMatcher
{
public:
    using TMatcher::TMatcher;

    tag_Answer Search(PYOFWORDS* pMap, Details vNames, const std::wstring& strInput)
    {
        const size_t n = strInput.size();
        for (unsigned s = 1U << (n - 1); s < 1U << n; ++s)
        {
            Pieces vPieces;
            for (size_t i = 0; i < n; ++i)
            {
                vPieces.resize(vPieces.size() + ((s >> (n - 1 - i)) & 1U));
                vPieces.back() += strInput[i];
            }
            TrySplit(pMap, vPieces, vPieces.size() == n, vNames);
        }
        // The mask is shown to comparisons with Chinese characters alone.
        Details vProbe = {MakeDetail(0, 0, {LOC_HANZI_BASE})};
        TrySplit(pMap, {L"$"}, true, vProbe);
        const int iCount = static_cast<int>(m_vMatches.size());
        Manager::LocalResultQuickSort(m_vMatches, 0, iCount - 1, vNames.data());
        tag_Answer answer = {{}, n == LOC_MAX_INPUT ? 0 : m_uMask, m_strWords};
        for (size_t i = 0; i < m_vMatches.size(); ++i)
        {
            answer.vEntries.push_back(vNames[static_cast<size_t>(m_vMatches[i].iIndex)]);
            answer.vEntries.back().iMatchPos = m_vMatches[i].iMatchPos;
        }
        return answer;
    }

private:
    void TrySplit(PYOFWORDS* pMap, Pieces vPieces, bool bInitials, Details& vNames)
    {
        android::Vector<wchar_t*> vLastFirst;
        FillLastFirst(vPieces, vLastFirst);
        const int iPieces = static_cast<int>(vPieces.size());
        for (size_t i = 0; this->IsValid(vLastFirst) != 0 && i < vNames.size(); ++i)
        {
            int iKeyLen = 0;
            int bAllFull = 0;
            if (this->DoCompare(pMap, &vNames[i], vLastFirst, iKeyLen, bAllFull) != 0)
            {
                const int iType = bInitials       ? MATCH_INITIALS
                                  : bAllFull != 0 ? MATCH_FULL
                                                  : MATCH_PARTIAL;
                const std::wstring strCodes(vNames[i].szLocalizerKey, 10);
                const int iStart = static_cast<int>(std::wcslen(strCodes.c_str())) - iKeyLen;
                // Adds nothing that the comparison has not added.
                this->CreateCNWordMask(pMap, strCodes.c_str()[iStart + iPieces]);
                Manager::AddToVector(m_vMatches, {static_cast<int>(i), iType,
                                                  MatchPosition(iStart, iStart + iPieces - 1), 0});
            }
        }
    }

    int CmpChineseWord(PYOFWORDS* pMap, wchar_t code, PYOFWORDS& record, wchar_t* szPiece,
                       _mask_type* pMask, int bLastPiece, int& bFull) override
    {
        const int iFits =
            TMatcher::CmpChineseWord(pMap, code, record, szPiece, pMask, bLastPiece, bFull);
        m_uMask = pMask->lMask;
        const std::wstring strWord = WideText(record.szWord);
        if (iFits != 0 && bLastPiece != 0 && szPiece[0] >= L'a' && szPiece[0] <= L'z' &&
            m_strWords.find(strWord) == std::wstring::npos && m_strWords.size() < CN_WORD_MAX)
        {
            m_strWords += strWord;
        }
        return iFits;
    }

    android::Vector<_MatchResult> m_vMatches;
    uint32_t m_uMask = 0;
    std::wstring m_strWords;
};

class Search : public LocalizerFixture
{
protected:
    size_t Below(size_t uLimit) { return m_random() % uLimit; }

    // iCount names of codes from strCodes; iSharing of them have one place in name order.
    Details RandomNames(int iCount, int iSharing, const std::wstring& strCodes)
    {
        Details vNames;
        for (int i = 0; i < iCount; ++i)
        {
            std::wstring strName(Below(6) == 0 ? Below(11) : 2 + Below(3), L'\0');
            std::generate(strName.begin(), strName.end(),
                          [&] { return strCodes[Below(strCodes.size())]; });
            const int iPlace = i * 7919 % iCount / iSharing;
            vNames.push_back(MakeDetail(i, iPlace * 1'234'567 - 99'999'999, strName));
        }
        return vNames;
    }

    template <class TMatcher>
    static tag_Answer DoSearch(Details& vNames, std::wstring& strInput, bool bAnywhere)
    {
        tag_Answer answer = {Details(vNames.size() + 1), 0, std::wstring(CN_WORD_MAX + 1, L'\0')};
        tag_LocalizerResult names = {static_cast<int>(vNames.size()), vNames.data()};
        tag_LocalizerResult result = {names.iResultNum, answer.vEntries.data()};
        long lMask = -1;
        TMatcher matcher(bAnywhere ? 1 : 0);
        EXPECT_EQ(0, matcher.DoSearch(&names, strInput.data(), IME_SEARCH_WORD, 0, &result, &lMask,
                                      answer.strWords.data()));
        answer.vEntries.resize(static_cast<size_t>(result.iResultNum));
        answer.strWords.resize(std::wcslen(answer.strWords.c_str()));
        answer.uMask = static_cast<uint32_t>(lMask);
        return answer;
    }

    // Searches both ways; returns the entries for a narrower search.
    template <class TMatcher>
    Details Compare(Details vNames, std::wstring strInput, bool bAnywhere)
    {
        SCOPED_TRACE("typed " + Utf8Text(strInput));
        const tag_Answer answer = DoSearch<TMatcher>(vNames, strInput, bAnywhere);
        CStepwise<TMatcher> stepwise(bAnywhere ? 1 : 0);
        const tag_Answer expected = stepwise.Search(m_pMap, vNames, strInput);
        EXPECT_EQ(answer.uMask, expected.uMask);
        EXPECT_EQ(Utf8Text(answer.strWords), Utf8Text(expected.strWords));
        EXPECT_TRUE(BytesOf(answer.vEntries) == BytesOf(expected.vEntries)) << "entries differ";
        return answer.vEntries;
    }
    Details Check(const Details& vNames, const std::wstring& strInput, bool bAnywhere = true)
    {
        const bool bDigits = strInput[0] >= L'0' && strInput[0] <= L'9';
        return bDigits ? Compare<CQVNumLocalizerManager>(vNames, strInput, bAnywhere)
                       : Compare<CQVWordLocalizerManager>(vNames, strInput, bAnywhere);
    }
    void CheckKeyByKey(const Details& vNames, const std::wstring& strInput)
    {
        Details vNarrowed = vNames;
        for (size_t uTyped = 1; uTyped <= strInput.size() && !HasFailure(); ++uTyped)
        {
            vNarrowed = Check(vNarrowed, strInput.substr(0, uTyped));
        }
        Check(vNames, strInput);
        Check(vNames, strInput, false);
    }

    // One comparison of pieces with a name, as Codes takes it.
    Compared Do(bool bDigits, const wchar_t* szName, Pieces vPieces, int iKeyLen = 0,
                int bAllFull = 0)
    {
        Manager& matcher = bDigits ? static_cast<Manager&>(m_digits) : m_letters;
        for (std::wstring& strPiece : vPieces)
        {
            matcher.ProcessInputCNWord(m_pMap, strPiece.data());
        }
        android::Vector<wchar_t*> vLastFirst;
        FillLastFirst(vPieces, vLastFirst);
        tag_LocalizerDetail detail = MakeDetail(0, 0, Codes(szName));
        const int iMatch = matcher.DoCompare(m_pMap, &detail, vLastFirst, iKeyLen, bAllFull);
        return {iMatch, iKeyLen, bAllFull};
    }

    std::mt19937 m_random{20240229};
    CQVNumLocalizerManager m_digits{1};
    CQVWordLocalizerManager m_letters{1};
};

} // namespace

TEST_F(Search, EveryShortTextOverCraftedNames)
{
    std::wistringstream names(
        L"张三 李张三 长孙无忌 曾长 重庆 乐乐 单田芳 解解 安安安安 王Li 王?安 "
        L"2安3 Zhang?San zaz a 安 嗯n 西安 先 ?安 中?国 朝阳区 行行行 阿啊a啊 "
        L"张2三 曾曾曾曾曾曾曾曾曾曾曾");
    Details vNames = {MakeDetail(99, 0, L"")};
    for (std::wstring strName; names >> strName;)
    {
        const int i = static_cast<int>(vNames.size());
        vNames.push_back(MakeDetail(99 + i, i / 2, Codes(strName))); // places in pairs
        if (i % 2 == 0 && strName.size() < 3)
        {
            vNames.back().szLocalizerKey[3] = HanZi(L'张'); // behind the end
        }
    }
    for (const std::wstring strAlphabet : {L"zhansi#张", L"246972"})
    {
        std::vector<std::wstring> vTexts = {L""};
        for (size_t i = 0; i < vTexts.size() && !HasFailure(); ++i)
        {
            for (size_t k = 0; vTexts[i].size() < 4 && k < strAlphabet.size(); ++k)
            {
                vTexts.push_back(vTexts[i] + strAlphabet[k]);
            }
            if (!vTexts[i].empty())
            {
                Check(vNames, vTexts[i]);
                Check(vNames, vTexts[i], false);
            }
        }
    }
}

TEST_F(Search, LongTextsOverRandomNamesTypedKeyByKey)
{
    const std::wstring strCodes =
        Codes(L"张章长常江姜蒋庄双安恩啊西乐解单曾重行嗯aghnz2?") + L"\x6FFF\x15000\x24F07\x30000";
    std::wstring strMany;
    for (int i = 0; i < PY_WORD_COUNT; i += 17)
    {
        strMany += LOC_HANZI_BASE + static_cast<wchar_t>(i);
    }
    const Details BOOKS[] = {RandomNames(200, 7, strCodes), RandomNames(1500, 1, strMany),
                             RandomNames(1200, 1, strCodes.substr(3, 6))};
    for (const Details& vNames : BOOKS)
    {
        for (const wchar_t* szText :
             {L"zhuangchan", L"changzhang", L"jiangan", L"anan#shuan", L"xianganzha", L"zcjx",
              L"943", L"9426454264", L"242642954", L"2626242642", L"74826494"})
        {
            CheckKeyByKey(vNames, szText);
        }
    }
}

TEST_F(Search, FitsPiecesToCharacters)
{
    // Whether as digits, name, pieces, what the comparison answers.
    const std::tuple<bool, const wchar_t*, Pieces, Compared> ROWS[] = {
        {false, L"李张三", {L"zhang", L"s"}, {1, 2, 0}},
        {false, L"张三", {L"z", L"san"}, {1, 2, 0}},
        {false, L"李张三", {L"zhang", L"san"}, {1, 2, 1}},
        {false, L"张三", {L"zhang", L"sa"}, {1, 2, 0}},
        {false, L"张三", {L"张", L"s"}, {1, 2, 0}},
        {false, L"张三", {L"張", L"三"}, {1, 2, 1}},
        {false, L"张三", {L"s", L"z"}, {0, 0, 0}},
        {false, L"张三", {L"z", L"s", L"s"}, {0, 0, 0}},
        {false, L"张三", {L"zhangs"}, {0, 0, 0}},
        {false, L"长三", {L"zhang"}, {1, 2, 1}},
        {false, L"a三b?7?", {L"a", L"san", L"b", L"#", L"7", L"#"}, {1, 6, 1}},
        {false, L"a7?", {L"#"}, {1, 2, 1}},
        {false, L"a三7?", {L"8"}, {0, 0, 0}},
        {false, L"a三7?", {L"77"}, {0, 0, 0}},
        {false, L"a三7?", {L"##"}, {0, 0, 0}},
        {true, L"长三", {L"94264", L"7"}, {1, 2, 0}},
        {true, L"长三", {L"24264", L"726"}, {1, 2, 1}},
        {true, L"长三", {L"92"}, {0, 0, 0}},
        {true, L"?7", {L"7"}, {1, 1, 1}},
        {true, L"?7", {L"#"}, {0, 0, 0}},
        {true, L"?7", {L"77"}, {0, 0, 0}},
        {true, L"adgjmptw", {L"2", L"3", L"4", L"5", L"6", L"7", L"8", L"9"}, {1, 8, 1}},
        {true, L"cfilosvz", {L"2", L"3", L"4", L"5", L"6", L"7", L"8", L"9"}, {1, 8, 1}}};
    for (const auto& [bDigits, szName, vPieces, expected] : ROWS)
    {
        EXPECT_EQ(Do(bDigits, szName, vPieces), expected)
            << Utf8Text(szName) << ' ' << testing::PrintToString(vPieces);
    }
    // Lengths that are handed in stay unless all is whole.
    EXPECT_EQ(Do(false, L"三", {L"s"}, 7, 0), (Compared{1, 7, 0}));
    EXPECT_EQ(Do(false, L"三", {L"san"}, 7, 0), (Compared{1, 1, 1}));
    EXPECT_EQ(Do(false, L"三", {L"san"}, 7, 1), (Compared{1, 7, 1}));
    // An empty slot is no end of the readings, and nothing begins it.
    PYOFWORDS reading = {"张", {"chang", "", "zhang"}, {"24264", "", "94264"}};
    PYOFWORDS noReading = {"张", {}, {}};
    wchar_t szAnyKey[] = L"#";
    wchar_t szSeven[] = L"7";
    const auto Fits = [](Manager& matcher, PYOFWORDS& record, std::wstring strPiece)
    {
        int bFull = 0;
        const int iFits =
            matcher.CmpChineseWord(nullptr, 1, record, strPiece.data(), nullptr, 0, bFull);
        return std::pair(iFits, bFull);
    };
    EXPECT_EQ(Fits(m_letters, reading, L"zhang"), std::pair(1, 1));
    EXPECT_EQ(Fits(m_digits, reading, L"94264"), std::pair(1, 1));
    EXPECT_EQ(Fits(m_digits, noReading, L""), std::pair(0, 0));
    EXPECT_EQ(m_letters.CmpOtherWords(DAMAGED_CODE, szAnyKey), 0);
    CLogCapture log;
    EXPECT_EQ(m_digits.CmpDigitalWord(LOC_DIGIT_BASE + 7, szSeven), 1);
    EXPECT_EQ(log.Take(), "[3 LocalizerImpl/QVNumLocalizerManager] "
                          "QV_Contacts:CQVNumLocalizerManager::CmpDigitalWord r == 1$\n");
}

TEST_F(Search, TriesOnlyWhatCanEndAText)
{
    const std::tuple<const wchar_t*, int, int> ROWS[] = {
        {L"#", 1, 1},  {L"1", 1, 1},  {L"z", 1, 1},      {L"zx", 0, 0},      {L"z#", 0, 0},
        {L"zh", 1, 0}, {L"29", 0, 1}, {L"21", 0, 0},     {L"zhuang", 1, 0},  {L"zhuangs", 0, 0},
        {L"92", 0, 1}, {L"2:", 0, 0}, {L"948264", 0, 1}, {L"9482647", 0, 0}, {L"", 1, 1}};
    for (const auto& [szPiece, bAsLetters, bAsDigits] : ROWS)
    {
        Pieces vPieces = {L"!", szPiece};
        android::Vector<wchar_t*> vLastFirst;
        FillLastFirst(vPieces, vLastFirst);
        EXPECT_EQ(m_letters.IsValid(vLastFirst), bAsLetters) << Utf8Text(szPiece);
        EXPECT_EQ(m_digits.IsValid(vLastFirst), bAsDigits) << Utf8Text(szPiece);
    }
}

// Kind, start and span decide, then the place in name order; ties end where the exchanges of the
// sort leave them.
TEST_F(Search, RanksMatches)
{
    const int ROWS[][4] = {
        // kind, first and last matched character, place in name order
        {MATCH_FULL, 0, 1, -5},    {MATCH_PARTIAL, 0, 1, 3}, {MATCH_PARTIAL, 0, 1, 3},
        {MATCH_INITIALS, 2, 3, 3}, {MATCH_PARTIAL, 0, 1, 1}, {MATCH_PARTIAL, 0, 2, 3},
        {MATCH_PARTIAL, 0, 1, 3},  {MATCH_PARTIAL, 0, 1, 2}, {MATCH_INITIALS, 1, 2, 3}};
    Details vNames;
    android::Vector<_MatchResult> vMatches;
    android::Vector<_MatchResult> vSlow;
    for (const auto& [iKind, iFirst, iLast, iPlace] : ROWS)
    {
        const int i = static_cast<int>(vNames.size());
        vNames.push_back(MakeDetail(i, iPlace, L""));
        Manager::AddToVector(vMatches, {i, MATCH_INITIALS, 0, 0}); // replaced
        Manager::AddToVector(vMatches, {i, iKind, MatchPosition(iFirst, iLast), 0});
        vSlow.push(vMatches[static_cast<size_t>(i)]);
    }
    EXPECT_EQ(Manager::LocalResultQuickSort(vMatches, 0, 8, vNames.data()), 1);
    Manager::LocalResultQuickSort(vSlow, vNames.data());
    std::vector<int> vOrder;
    for (size_t i = 0; i < vMatches.size(); ++i)
    {
        vOrder.push_back(vMatches[i].iIndex);
        EXPECT_EQ(vSlow[i].iIndex, vMatches[i].iIndex) << "as it happens, here also of ties";
    }
    EXPECT_EQ(vOrder, (std::vector<int>{8, 3, 0, 5, 4, 7, 6, 2, 1}));
}

TEST_F(Search, JudgesWhetherTheMatchedCharactersAreLettersOrOthers)
{
    const std::tuple<const wchar_t*, int, int> ROWS[] = {
        {L"ab?", 0x00002, 1}, {L"a三b", 0x00001, 0},       {L"a三b", 0x20002, 1},
        {L"a7", 0x00001, 0},  {L"abcdefghij", 0x00009, 1}, {L"abcdefghij", 0x0FFFF, 0}};
    for (const auto& [szName, iMatchPos, bExpected] : ROWS)
    {
        tag_LocalizerDetail detail = MakeDetail(0, 0, Codes(szName));
        detail.iMatchPos = iMatchPos;
        EXPECT_EQ(Manager::JudgeAllEnglish(&detail), bExpected) << iMatchPos;
    }
}

TEST_F(Search, FindsThePlaceOfAChangedRecord)
{
    tag_ContactsStruct aStored[3] = {};
    std::wcscpy(aStored[0].szName, L"三");
    std::wcscpy(aStored[1].szName, L"张三");
    for (int i = 0; i < 3; ++i)
    {
        aStored[i].llLastTimeContacted = 30 - 10 * i;
    }
    ASSERT_EQ(Manager::TransNameToPY(aStored, 3), 0);
    // Name, number of records, sort type and time; the place, and the name afterwards.
    const std::tuple<const wchar_t*, int, int, int, int, const wchar_t*> ROWS[] = {
        {L"愛", 3, 0, 0, 0, L"ai 爱"},   {L"张三", 3, 0, 0, 1, L"zhang 张san 三"},
        {L"赵", 3, 0, 0, 2, L"zhao 赵"}, {L"赵", 0, 0, 0, 0, L"zhao 赵"},
        {L"赵", 3, 1, 25, 1, L"赵"},     {L"赵", 3, 1, 10, 3, L"赵"}};
    for (const auto& [szName, iCount, iSortType, iTime, iPlace, szNameAfter] : ROWS)
    {
        tag_ContactsStruct record = {};
        std::wcscpy(record.szName, szName);
        record.llLastTimeContacted = iTime;
        EXPECT_EQ(Manager::LocalizerSearchPos(aStored, iCount, &record, iSortType), iPlace);
        EXPECT_STREQ(record.szName, szNameAfter);
    }
    RemoveTable();
    EXPECT_EQ(Manager::LocalizerSearchPos(aStored, 3, aStored, 0), -1);
}

// Threads of callers may have little stack, for a search and for a sort whose parts lack one match
// only.
TEST_F(Search, NeedsNoMoreStackForManyMatches)
{
    constexpr size_t SMALL_STACK = 192 * 1024; // sanitizers take most of it
    constexpr int MATCHES = 6000;
    Details vNames;
    android::Vector<_MatchResult> vMatches;
    for (int i = 0; i < MATCHES; ++i)
    {
        vNames.push_back(MakeDetail(i, i, {LOC_ALPHA_BASE + 25}));
        vMatches.push({MATCHES - 1 - i, MATCH_INITIALS, 0, 0});
    }
    std::wstring strInput = L"z";
    pthread_attr_t attributes;
    pthread_attr_init(&attributes);
    pthread_attr_setstacksize(&attributes, SMALL_STACK);
    ASSERT_EQ(pthread_setattr_default_np(&attributes), 0);
    std::thread(
        [&]
        {
            vNames = DoSearch<CQVWordLocalizerManager>(vNames, strInput, true).vEntries;
            Manager::LocalResultQuickSort(vMatches, 0, MATCHES - 1, vNames.data());
        })
        .join();
    EXPECT_TRUE(std::is_sorted(vMatches.editArray(), vMatches.editArray() + MATCHES,
                               [](const auto& a, const auto& b) { return a.iIndex < b.iIndex; }));
}
