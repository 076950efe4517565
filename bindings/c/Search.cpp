// Searches and their results. Results are returned without a copy: qv_match has the layout of an
// entry of a result set.

#include "Filter/FilterChain.h"
#include "bindings/c/Objects.h"

#include <algorithm>
#include <iterator>
#include <memory>
#include <new>

static_assert(sizeof(qv_match) == sizeof(tag_LocalizerDetail), "same entries");
static_assert(offsetof(qv_match, contact_id) == offsetof(tag_LocalizerDetail, iContactID));
static_assert(offsetof(qv_match, name_order) == offsetof(tag_LocalizerDetail, iSortIndex));
static_assert(offsetof(qv_match, codes) == offsetof(tag_LocalizerDetail, szLocalizerKey));
static_assert(sizeof(qv_match::codes) == sizeof(tag_LocalizerDetail::szLocalizerKey));
static_assert(offsetof(qv_match, last) == offsetof(tag_LocalizerDetail, iMatchPos), "low half");
static_assert(offsetof(qv_match, first) == offsetof(qv_match, last) + 2, "high half");
static_assert(offsetof(qv_match, index_character) == offsetof(tag_LocalizerDetail, iFirstWord));
static_assert(offsetof(qv_match, last_contacted) ==
              offsetof(tag_LocalizerDetail, llLastTimeContacted));
static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "the low half lies first");

static_assert(int{QV_KIND_WORD} == IME_SEARCH_WORD && int{QV_KIND_DIGITS} == IME_SEARCH_NUM &&
                  int{QV_KIND_SPECIAL} == IME_SEARCH_SPECIAL,
              "passed on as they are");
static_assert(QV_FILTER_GROUP == FILTER_GROUP && QV_FILTER_ACCOUNT == FILTER_ACCOUNT &&
                  QV_FILTER_PHONE == FILTER_PHONE && QV_FILTER_STARRED == FILTER_FAVOURITES &&
                  QV_FILTER_NOT_GROUP == FILTER_GROUP_EXPAND && QV_FILTER_MAIL == FILTER_MAIL &&
                  QV_FILTER_POSTAL == FILTER_POSTAL &&
                  QV_FILTER_NOT_ACCOUNT == FILTER_ACCOUNT_EXPAND &&
                  QV_FILTER_NOT_CONTACT == FILTER_CONTACT_ID_EXPAND &&
                  QV_FILTER_ONLINE == FILTER_ONLINE,
              "passed on as they are");
static_assert(QV_KEY_OTHER == MASK_OTHER, "passed on as it is");

namespace
{

constexpr size_t MAX_FILTERS = 1U << 20; // far beyond any use, and no size overflows

constexpr int LETTERS = 26;
constexpr int OTHER_SECTION = LETTERS; // '#', between the letters and the times
constexpr int TIMES = 5;
static_assert(OTHER_SECTION + 1 + TIMES == QV_MAX_SECTIONS, "every index character has a place");

bool IsFilterKind(int32_t iKind)
{
    constexpr int32_t FIRST_UNUSED = 3;
    constexpr int32_t LAST_UNUSED = 4;
    return iKind >= QV_FILTER_GROUP && iKind <= QV_FILTER_ONLINE &&
           (iKind < FIRST_UNUSED || iKind > LAST_UNUSED);
}

bool IsValid(const qv_query& query)
{
    return query.text != nullptr && query.kind >= QV_KIND_WORD && query.kind <= QV_KIND_SPECIAL &&
           (query.filters != nullptr || query.filter_count == 0) &&
           query.filter_count <= MAX_FILTERS &&
           std::all_of(query.filters, query.filters + query.filter_count,
                       [](const qv_filter& filter) { return IsFilterKind(filter.kind); });
}

int MakeChain(CLocalizerLogic& logic, const qv_query& query, std::unique_ptr<CFilterChain>& chain)
{
    // One more than filled: the library requires arrays even for no filter.
    const std::unique_ptr<int[]> kinds(new (std::nothrow) int[query.filter_count + 1]);
    const std::unique_ptr<QVLong32[]> ids(new (std::nothrow) QVLong32[query.filter_count + 1]);
    if (kinds == nullptr || ids == nullptr)
    {
        return QV_ERROR_MEMORY;
    }
    for (size_t i = 0; i < query.filter_count; ++i)
    {
        kinds[i] = query.filters[i].kind;
        ids[i] = query.filters[i].id;
    }
    CFilterChain* pChain = nullptr;
    const int iResult = logic.CreateFilterChain(kinds.get(), ids.get(),
                                                static_cast<int>(query.filter_count), &pChain);
    chain.reset(pChain);
    return iResult == 0 ? QV_OK : QV_ERROR_MEMORY;
}

int StatusOfSearch(int iResult)
{
    switch (iResult)
    {
    case 0:
        return QV_OK;
    case LOC_ERR_MAP:
        return QV_ERROR_PINYIN;
    default:
        return QV_ERROR_MEMORY; // arguments are checked
    }
}

// Place of an index character among the sections.
int SectionOf(int32_t iCharacter)
{
    if (iCharacter >= 'A' && iCharacter <= 'Z')
    {
        return iCharacter - 'A';
    }
    return iCharacter >= '1' && iCharacter < '1' + TIMES ? OTHER_SECTION + 1 + iCharacter - '1'
                                                         : OTHER_SECTION;
}

int32_t LabelOf(int iSection)
{
    if (iSection < LETTERS)
    {
        return 'A' + iSection;
    }
    return iSection == OTHER_SECTION ? '#' : '1' + iSection - OTHER_SECTION - 1;
}

} // namespace

int qv_search(qv_index* index, const qv_query* query, const qv_result* previous, qv_result** result)
{
    if (result == nullptr)
    {
        return QV_ERROR_ARGUMENT;
    }
    *result = nullptr;
    if (index == nullptr || query == nullptr || !IsValid(*query))
    {
        return QV_ERROR_ARGUMENT;
    }
    wchar_t szInput[QV_MAX_TYPED + 1] = {}; // the search changes it in place
    int iStatus = DecodeShort(query->text, szInput, QV_MAX_TYPED);
    std::unique_ptr<CFilterChain> chain;
    if (iStatus == QV_OK)
    {
        iStatus = MakeChain(index->m_logic, *query, chain);
    }
    std::unique_ptr<qv_result> found(new (std::nothrow) qv_result);
    if (iStatus != QV_OK || found == nullptr)
    {
        return iStatus != QV_OK ? iStatus : QV_ERROR_MEMORY;
    }
    long lMask = 0;
    wchar_t szWords[CN_WORD_MAX + 1] = {};
    iStatus =
        StatusOfSearch(index->m_logic.Search(previous != nullptr ? previous->m_pSet : nullptr,
                                             szInput, static_cast<IME_SEARCH_TYPE>(query->kind),
                                             chain.get(), 0, &found->m_pSet, &lMask, szWords));
    const bool bNothing =
        iStatus == QV_ERROR_PINYIN || (iStatus == QV_OK && found->m_pSet->iResultNum == 0);
    if (bNothing && previous == nullptr && IsNeedReload() != 0)
    {
        return QV_ERROR_NOT_BUILT;
    }
    if (iStatus != QV_OK)
    {
        return iStatus;
    }
    found->m_uNextKeys = static_cast<uint32_t>(lMask);
    found->m_bOfEmptyText = query->text[0] == 0;
    EncodeText(szWords, found->m_szCandidates, sizeof(found->m_szCandidates));
    *result = found.release();
    return QV_OK;
}

void qv_result_free(qv_result* result)
{
    delete result;
}

size_t qv_result_count(const qv_result* result)
{
    return result != nullptr ? static_cast<size_t>(result->m_pSet->iResultNum) : 0;
}

const qv_match* qv_result_matches(const qv_result* result)
{
    return qv_result_count(result) > 0 ? reinterpret_cast<const qv_match*>(result->m_pSet->pDetail)
                                       : nullptr;
}

int qv_result_page(const qv_result* result, size_t start, size_t count, const qv_match** page)
{
    const size_t uAll = qv_result_count(result);
    if (result == nullptr || page == nullptr || start > uAll || count > uAll - start)
    {
        return QV_ERROR_ARGUMENT;
    }
    const qv_match* pMatches = qv_result_matches(result);
    *page = pMatches != nullptr ? pMatches + start : nullptr;
    return QV_OK;
}

ptrdiff_t qv_result_find(const qv_result* result, int32_t contact_id)
{
    const size_t uAll = qv_result_count(result);
    for (size_t i = 0; i < uAll; ++i)
    {
        if (result->m_pSet->pDetail[i].iContactID == contact_id)
        {
            return static_cast<ptrdiff_t>(i);
        }
    }
    return -1;
}

size_t qv_result_sections(const qv_result* result, qv_section sections[QV_MAX_SECTIONS])
{
    if (result == nullptr || sections == nullptr || !result->m_bOfEmptyText)
    {
        return 0;
    }
    qv_section aAll[QV_MAX_SECTIONS] = {};
    for (int32_t i = 0; i < result->m_pSet->iResultNum; ++i)
    {
        const int iSection = SectionOf(result->m_pSet->pDetail[i].iFirstWord);
        qv_section& section = aAll[iSection];
        if (section.count++ == 0)
        {
            section.label = LabelOf(iSection);
            section.first = i;
        }
    }
    return static_cast<size_t>(std::copy_if(std::begin(aAll), std::end(aAll), sections,
                                            [](const qv_section& section)
                                            { return section.count > 0; }) -
                               sections);
}

uint32_t qv_next_keys(const qv_result* result)
{
    return result != nullptr ? result->m_uNextKeys : 0;
}

const char* qv_candidates(const qv_result* result)
{
    return result != nullptr ? result->m_szCandidates : "";
}
