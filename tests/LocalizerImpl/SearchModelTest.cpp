// The search against the model: every short text over a small alphabet, then long texts over many
// random names, narrowed and not, with places in name order that repeat and that do not.

#include "tests/LocalizerImpl/SearchModel.h"

#include "Common/DataPaths.h"
#include "LocalizerImpl/QVNumLocalizerManager.h"
#include "LocalizerImpl/QVWordLocalizerManager.h"
#include "LocalizerImpl/Syllables.h"
#include "tests/LocalizerImpl/PlainQuickSort.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/WideText.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <memory>
#include <random>
#include <tuple>

namespace
{

constexpr unsigned SEED = 20240229;
constexpr size_t CANDIDATES = 20;

} // namespace

tag_LocalizerDetail MakeDetail(int iId, int iSortIndex, const std::wstring& strCodes)
{
    tag_LocalizerDetail detail = {};
    detail.iContactID = iId;
    detail.iSortIndex = iSortIndex;
    std::copy_n(strCodes.begin(), std::min<size_t>(strCodes.size(), 10), detail.szLocalizerKey);
    return detail;
}

const char* CSearchModel::Spelling(wchar_t code, int iReading, bool bKeys) const
{
    const PYOFWORDS& record = m_pTable[code - LOC_HANZI_BASE];
    return bKeys ? record.szPinyinNum[iReading] : record.szPinyin[iReading];
}

std::vector<CSearchModel::Pieces> CSearchModel::Splits(const std::wstring& strInput)
{
    const size_t n = strInput.size();
    std::vector<Pieces> vSplits;
    for (unsigned s = 1U << (n - 1); s < 1U << n; ++s)
    {
        Pieces vPieces;
        for (size_t i = 0; i < n; ++i)
        {
            if ((s >> (n - 1 - i)) & 1U)
            {
                vPieces.emplace_back();
            }
            vPieces.back() += strInput[i];
        }
        vSplits.push_back(vPieces);
    }
    return vSplits;
}

bool CSearchModel::IsValid(const std::wstring& strLast) const
{
    if (strLast.size() > 6)
    {
        return false;
    }
    if (strLast.size() < 2)
    {
        return true;
    }
    if (m_bDigits)
    {
        return strLast.find_first_not_of(L"23456789") == std::wstring::npos;
    }
    return std::any_of(std::begin(g_pyWords), std::end(g_pyWords),
                       [&](const wchar_t* szSyllable) {
                           return std::wstring(szSyllable).compare(0, strLast.size(), strLast) == 0;
                       });
}

bool CSearchModel::FitsChinese(wchar_t code, const std::wstring& strPiece, bool& bFull) const
{
    if (!m_bDigits && strPiece == std::wstring(1, code))
    {
        return bFull = true;
    }
    bool bFits = false;
    for (int i = 0; i < PY_READINGS; ++i)
    {
        const std::string strSpelling = Spelling(code, i, m_bDigits);
        const std::wstring strWide(strSpelling.begin(), strSpelling.end());
        if (!strWide.empty() && strWide.compare(0, strPiece.size(), strPiece) == 0)
        {
            bFits = true;
            bFull = bFull || strWide == strPiece;
        }
    }
    return bFits;
}

bool CSearchModel::Fits(wchar_t code, const std::wstring& strPiece, bool& bFull) const
{
    static const std::wstring KEYS = L"22233344455566677778889999";
    if (IsHanZiCode(CodeBits(code)))
    {
        return FitsChinese(code, strPiece, bFull);
    }
    bFull = true;
    if (strPiece.size() != 1)
    {
        return false;
    }
    if (IsAlphaCode(CodeBits(code)))
    {
        const wchar_t k = code - LOC_ALPHA_BASE;
        return strPiece[0] == (m_bDigits ? KEYS[static_cast<size_t>(k)] : L'a' + k);
    }
    const bool bAny = !m_bDigits && strPiece[0] == L'#';
    if (IsDigitCode(CodeBits(code)))
    {
        return bAny || strPiece[0] == L'0' + (code - LOC_DIGIT_BASE);
    }
    return bAny && code == LOC_OTHER;
}

void CSearchModel::OfferNext(wchar_t code)
{
    if (IsAlphaCode(CodeBits(code)))
    {
        m_uMask |= 1U << (code - LOC_ALPHA_BASE);
    }
    else if (IsHanZiCode(CodeBits(code)))
    {
        for (int i = 0; i < PY_READINGS; ++i)
        {
            const char* szReading = Spelling(code, i, false);
            m_uMask |= szReading[0] != 0 ? 1U << (szReading[0] - 'a') : 0;
        }
    }
    else if (IsDigitCode(CodeBits(code)) || code == LOC_OTHER)
    {
        m_uMask |= MASK_OTHER;
    }
}

void CSearchModel::OfferLastPiece(wchar_t code, const std::wstring& strPiece)
{
    if (m_bDigits || !IsHanZiCode(CodeBits(code)) || strPiece == std::wstring(1, code))
    {
        return;
    }
    for (int i = 0; i < PY_READINGS; ++i)
    {
        const std::string strReading = Spelling(code, i, false);
        const std::wstring strWide(strReading.begin(), strReading.end());
        if (strWide.empty() || strWide.compare(0, strPiece.size(), strPiece) != 0)
        {
            continue;
        }
        if (strWide.size() > strPiece.size())
        {
            m_uMask |= 1U << (strWide[strPiece.size()] - L'a');
        }
        wchar_t szWord[5] = {};
        Utf82Unicode(m_pTable[code - LOC_HANZI_BASE].szWord, szWord, 3);
        if (m_strWords.find(szWord[0]) == std::wstring::npos && m_strWords.size() < CANDIDATES)
        {
            m_strWords += szWord[0];
        }
    }
}

void CSearchModel::Try(const Pieces& vPieces, const tag_LocalizerDetail& name, size_t uCandidate)
{
    const std::wstring strCodes = name.szLocalizerKey;
    for (size_t uStart = 0; uStart + vPieces.size() <= strCodes.size(); ++uStart)
    {
        bool bFits = true;
        bool bAllFull = true;
        for (size_t i = 0; bFits && i < vPieces.size(); ++i)
        {
            bool bFull = false;
            bFits = Fits(strCodes[uStart + i], vPieces[i], bFull);
            bAllFull = bAllFull && bFull;
        }
        if (bFits)
        {
            Succeed(vPieces, strCodes, uStart, bAllFull, name, uCandidate);
            return;
        }
        if (!m_bAnywhere)
        {
            return;
        }
    }
}

void CSearchModel::Succeed(const Pieces& vPieces, const std::wstring& strCodes, size_t uStart,
                           bool bAllFull, const tag_LocalizerDetail& name, size_t uCandidate)
{
    OfferLastPiece(strCodes[uStart + vPieces.size() - 1], vPieces.back());
    if (uStart + vPieces.size() < strCodes.size())
    {
        OfferNext(strCodes[uStart + vPieces.size()]);
    }
    const int iKind = vPieces.size() == m_uInputLen ? 3 : (bAllFull ? 2 : 1);
    const tag_Found found = {uCandidate, iKind, static_cast<int>(uStart),
                             static_cast<int>(vPieces.size()), name.iSortIndex};
    for (tag_Found& earlier : m_vFound)
    {
        if (earlier.uCandidate == uCandidate)
        {
            earlier = found;
            return;
        }
    }
    m_vFound.push_back(found);
}

bool CSearchModel::ComesBefore(const tag_Found& a, const tag_Found& b)
{
    const auto keys = [](const tag_Found& found)
    { return std::tuple(-found.iType, found.iStart, -found.iPieces, found.iSortIndex); };
    return keys(a) < keys(b);
}

tag_Answer CSearchModel::Search(const std::vector<tag_LocalizerDetail>& vCandidates,
                                const std::wstring& strInput)
{
    m_uInputLen = strInput.size();
    m_vFound.clear();
    m_strWords.clear();
    m_uMask = 0;
    for (const Pieces& vPieces : Splits(strInput))
    {
        for (size_t i = 0; IsValid(vPieces.back()) && i < vCandidates.size(); ++i)
        {
            Try(vPieces, vCandidates[i], i);
        }
    }
    PlainQuickSort(m_vFound.data(), 0, static_cast<int>(m_vFound.size()) - 1, ComesBefore);
    tag_Answer answer;
    for (const tag_Found& found : m_vFound)
    {
        answer.vEntries.push_back(vCandidates[found.uCandidate]);
        answer.vEntries.back().iMatchPos =
            (found.iStart << 16) | (found.iStart + found.iPieces - 1);
        answer.vEntries.back().iFirstWord = 0;
    }
    answer.uMask = m_uInputLen == 10 ? 0 : m_uMask;
    answer.strWords = m_strWords;
    return answer;
}

namespace
{

class CSearchModelTest : public ::testing::Test
{
protected:
    void SetUp() override
    {
        m_directory.InstallPinyinTable();
        ASSERT_EQ(0, CQVLocalizerManager::InitMapFile());
        ASSERT_EQ(0, CQVLocalizerManager::MemInit(&m_pMap));
    }
    void TearDown() override { CQVLocalizerManager::MemRelease(m_pMap); }

    const PYOFWORDS* Table() const { return static_cast<const PYOFWORDS*>(m_pMap); }

    std::wstring CodesOf(const wchar_t* szName)
    {
        std::wstring strName = szName;
        wchar_t szCodes[11] = {};
        EXPECT_EQ(0, CQVLocalizerManager::GetLocalizerChars(strName.data(), szCodes));
        return szCodes;
    }

    tag_Answer RunSearch(std::vector<tag_LocalizerDetail> vCandidates, std::wstring& strInput,
                         bool bDigits, bool bAnywhere)
    {
        const std::unique_ptr<CQVLocalizerManager> matcher(
            bDigits ? static_cast<CQVLocalizerManager*>(new CQVNumLocalizerManager(bAnywhere))
                    : new CQVWordLocalizerManager(bAnywhere));
        std::vector<tag_LocalizerDetail> vEntries(vCandidates.size() + 1);
        tag_LocalizerResult candidates = {static_cast<int>(vCandidates.size()), vCandidates.data()};
        tag_LocalizerResult result = {static_cast<int>(vCandidates.size()), vEntries.data()};
        long lMask = -1;
        wchar_t szWords[64] = {};
        EXPECT_EQ(0, matcher->DoSearch(&candidates, strInput.data(),
                                       bDigits ? IME_SEARCH_NUM : IME_SEARCH_WORD, 0, &result,
                                       &lMask, szWords));
        vEntries.resize(static_cast<size_t>(result.iResultNum));
        return {vEntries, static_cast<uint32_t>(lMask), szWords};
    }

    // Compares one search with the model; returns the entries for a narrower one.
    std::vector<tag_LocalizerDetail> Check(const std::vector<tag_LocalizerDetail>& vCandidates,
                                           const std::wstring& strTyped, bool bDigits,
                                           bool bAnywhere = true)
    {
        std::wstring strInput = strTyped;
        const tag_Answer got = RunSearch(vCandidates, strInput, bDigits, bAnywhere);
        CSearchModel model(Table(), bDigits, bAnywhere);
        const tag_Answer want = model.Search(vCandidates, strInput);
        SCOPED_TRACE("typed " + Narrow(strTyped) + (bDigits ? " as digits" : " as letters"));
        EXPECT_EQ(want.uMask, got.uMask);
        EXPECT_EQ(Narrow(want.strWords), Narrow(got.strWords));
        EXPECT_EQ(want.vEntries.size(), got.vEntries.size());
        const bool bSame = want.vEntries.size() == got.vEntries.size() &&
                           (want.vEntries.empty() ||
                            std::memcmp(want.vEntries.data(), got.vEntries.data(),
                                        want.vEntries.size() * sizeof(tag_LocalizerDetail)) == 0);
        EXPECT_TRUE(bSame) << "entries differ";
        return got.vEntries;
    }

    CDataDirectory m_directory;
    void* m_pMap = nullptr;
};

const wchar_t* const CRAFTED_NAMES[] = {
    L"张三",      L"李张三", L"长孙无忌", L"曾长",
    L"重庆",      L"乐乐",   L"单田芳",   L"解解",
    L"安安安安",  L"王Li",   L"王 安",    L"2安3",
    L"Zhang San", L"zaz",    L"a",        L"安",
    L"嗯n",       L"西安",   L"先",       L"#安",
    L"",          L"中 国",  L"朝阳区",   L"行行行",
    L"阿啊a啊",   L"张2三",  L"é安",      L"曾曾曾曾曾曾曾曾曾曾曾"};

TEST_F(CSearchModelTest, EveryShortTextOverCraftedNames)
{
    std::vector<tag_LocalizerDetail> vNames;
    for (const wchar_t* szName : CRAFTED_NAMES)
    {
        const int i = static_cast<int>(vNames.size());
        vNames.push_back(MakeDetail(100 + i, i / 2, CodesOf(szName))); // places in pairs
        if (i % 2 == 0 && CodesOf(szName).size() < 3)
        {
            vNames.back().szLocalizerKey[3] = CodesOf(L"张")[0]; // behind the end
        }
    }
    const std::pair<std::wstring, bool> ALPHABETS[] = {{L"zhansi#张", false}, {L"246972", true}};
    for (const auto& [strAlphabet, bDigits] : ALPHABETS)
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
                Check(vNames, vTexts[i], bDigits);
                Check(vNames, vTexts[i], bDigits, false);
            }
        }
    }
}

// Names of a random address book, with a few codes that only a damaged record holds.
class CRandomNames
{
public:
    CRandomNames(const PYOFWORDS* pTable, unsigned uSeed) : m_pTable(pTable), m_random(uSeed) {}

    size_t Below(size_t uLimit) { return m_random() % uLimit; }

    std::wstring Codes(size_t uCharacters)
    {
        std::wstring strCodes;
        const size_t uLength = Below(6) == 0 ? Below(11) : 2 + Below(3);
        for (size_t i = 0; i < uLength; ++i)
        {
            strCodes += Code(uCharacters);
        }
        return strCodes;
    }

    // What a person would type for the name, or nearly so.
    std::wstring Text(const std::wstring& strCodes, bool bDigits)
    {
        std::wstring strText;
        for (const wchar_t code : strCodes)
        {
            const uint16_t uCode = CodeBits(code);
            if (IsHanZiCode(uCode))
            {
                const PYOFWORDS& record = m_pTable[uCode - LOC_HANZI_BASE];
                const auto& aSpellings = bDigits ? record.szPinyinNum : record.szPinyin;
                const char* szSpelling = aSpellings[Below(3)][0] != 0 ? aSpellings[Below(2)] : "";
                const std::string strSpelling = szSpelling[0] != 0 ? szSpelling : aSpellings[0];
                strText.append(strSpelling.begin(),
                               strSpelling.begin() +
                                   static_cast<long>(1 + Below(strSpelling.size())));
            }
            else if (IsAlphaCode(uCode))
            {
                strText += bDigits ? L'2' : static_cast<wchar_t>(L'a' + (uCode - LOC_ALPHA_BASE));
            }
            else
            {
                strText += bDigits ? L'0' : L'#';
            }
        }
        const size_t uStart = Below(3) == 0 ? Below(strText.size() + 1) : 0;
        return strText.substr(uStart, 1 + Below(10));
    }

private:
    wchar_t Code(size_t uCharacters)
    {
        switch (Below(12))
        {
        case 0:
            return static_cast<wchar_t>(LOC_ALPHA_BASE + static_cast<wchar_t>(Below(26)));
        case 1:
            return static_cast<wchar_t>(LOC_DIGIT_BASE + static_cast<wchar_t>(Below(10)));
        case 2:
            return Below(8) == 0 ? static_cast<wchar_t>(0x6FFF) : LOC_OTHER;
        default:
            return static_cast<wchar_t>(
                LOC_HANZI_BASE +
                static_cast<wchar_t>(Below(uCharacters) * (PY_WORD_COUNT / uCharacters)));
        }
    }

    const PYOFWORDS* m_pTable;
    std::mt19937 m_random;
};

struct tag_RandomCase
{
    const char* szWhy;
    int iNames;
    size_t uCharacters; // distinct Chinese characters of the address book
    int iPlacesShared;  // names per place in name order
    int iTexts;
};

const tag_RandomCase RANDOM_CASES[] = {
    {"a small address book, typed long", 60, 40, 1, 150},
    {"places in name order repeat", 200, 30, 7, 60},
    {"as many names as a fast path sees", 1500, 900, 1, 25},
    {"few characters, many matches", 1200, 6, 1, 12},
};

// Spellings of two letters and two keys that no person has: nearly every character has readings
// of its own, and texts are cut in ways that leave many different offsets reached.
TEST_F(CSearchModelTest, ATableOfRandomReadings)
{
    std::string strTable = CDataDirectory::ReadBytes(m_directory.File("pyfile.bin"));
    std::mt19937 random(SEED);
    for (size_t i = 0; i < PY_WORD_COUNT; ++i)
    {
        char* pSpelling = &strTable[i * sizeof(PYOFWORDS) + offsetof(PYOFWORDS, szPinyin)];
        for (const char* szUnits : {"an", "an", "an", "26", "26", "26"})
        {
            const size_t uLength = random() % (PY_MAX_LETTERS + 1);
            for (size_t k = 0; k <= PY_MAX_LETTERS; ++k)
            {
                *pSpelling++ = k < uLength ? szUnits[random() % 2] : '\0';
            }
        }
    }
    CDataDirectory::WriteBytes(CDataPaths::PinyinMapping(), strTable);
    CRandomNames names(Table(), SEED);
    std::vector<tag_LocalizerDetail> vNames;
    for (int i = 0; i < 120; ++i)
    {
        vNames.push_back(MakeDetail(i, i, names.Codes(PY_WORD_COUNT)));
    }
    for (int t = 0; t < 24 && !HasFailure(); ++t)
    {
        std::wstring strText;
        std::vector<tag_LocalizerDetail> vNarrowed = vNames;
        while (strText.size() < 10)
        {
            strText += (t % 2 == 0 ? L"26" : L"an")[random() % 2];
            vNarrowed = Check(vNarrowed, strText, t % 2 == 0);
        }
        Check(vNames, strText, t % 2 == 0, false);
    }
}

TEST_F(CSearchModelTest, LongTextsOverRandomNamesTypedKeyByKey)
{
    for (const tag_RandomCase& test : RANDOM_CASES)
    {
        SCOPED_TRACE(std::string(test.szWhy) + ", seed " + std::to_string(SEED));
        CRandomNames random(Table(), SEED);
        std::vector<tag_LocalizerDetail> vNames;
        for (int i = 0; i < test.iNames; ++i)
        {
            const int iPlace = (i * 7919) % test.iNames / test.iPlacesShared;
            vNames.push_back(MakeDetail(i, iPlace, random.Codes(test.uCharacters)));
        }
        for (int t = 0; t < test.iTexts && !HasFailure(); ++t)
        {
            const bool bDigits = t % 2 == 0;
            const std::wstring strText =
                random.Text(vNames[random.Below(vNames.size())].szLocalizerKey, bDigits);
            std::vector<tag_LocalizerDetail> vNarrowed = vNames;
            for (size_t uTyped = 1; uTyped <= strText.size(); ++uTyped)
            {
                vNarrowed = Check(vNarrowed, strText.substr(0, uTyped), bDigits);
            }
            if (!strText.empty())
            {
                Check(vNames, strText, bDigits);
            }
        }
    }
}

} // namespace
