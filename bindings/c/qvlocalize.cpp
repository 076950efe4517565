// The C interface over CLocalizerLogic: texts from and to UTF-8, private copies of what the class
// changes in place, ranges checked, results given words.

#include "bindings/c/qvlocalize.h"

#include "Common/DataPaths.h"
#include "Core/LocalizerLogic.h"
#include "Filter/FilterChain.h"
#include "LocalizerImpl/NameFolding.h"
#include "LocalizerImpl/PinyinTable.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "MemManager/MemManger.h"
#include "bindings/c/Utf8Text.h"
#ifndef __ANDROID__
#include "Platform/LogSink.h"
#endif

#include <unistd.h>

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <memory>
#include <mutex>
#include <new>

// A match is the entry of a result set under other names, so that results cross without a copy.
static_assert(sizeof(qv_match) == sizeof(tag_LocalizerDetail), "same entries");
static_assert(offsetof(qv_match, contact_id) == offsetof(tag_LocalizerDetail, iContactID), "");
static_assert(offsetof(qv_match, name_order) == offsetof(tag_LocalizerDetail, iSortIndex), "");
static_assert(offsetof(qv_match, codes) == offsetof(tag_LocalizerDetail, szLocalizerKey), "");
static_assert(sizeof(qv_match::codes) == sizeof(tag_LocalizerDetail::szLocalizerKey), "");
static_assert(offsetof(qv_match, last) == offsetof(tag_LocalizerDetail, iMatchPos), "low half");
static_assert(offsetof(qv_match, first) == offsetof(qv_match, last) + 2, "high half");
static_assert(offsetof(qv_match, index_character) == offsetof(tag_LocalizerDetail, iFirstWord), "");
static_assert(offsetof(qv_match, last_contacted) ==
                  offsetof(tag_LocalizerDetail, llLastTimeContacted),
              "");
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
static_assert(QV_SORT_NAME == STORE_ORDER_NAME && QV_SORT_TIME == STORE_ORDER_TIME,
              "passed on as they are");
static_assert(QV_KEY_OTHER == MASK_OTHER, "passed on as it is");
static_assert(QV_MAX_TYPED == LOC_MAX_INPUT, "the search takes as many");

namespace
{

constexpr const char* PROVIDER_ROOT = "/data/data/com.android.providers.contacts";

constexpr int MAX_PICKED = 3; // characters of a picked word, which fit the library's buffer
static_assert(QV_PICK_SIZE == (QV_MAX_TYPED + MAX_PICKED) * UTF8_MAX_BYTES + 1, "any text fits");
constexpr size_t CODE_BYTES = 3; // no code needs more in UTF-8
static_assert(QV_KEY_SIZE == CONTACT_MAX_KEY * CODE_BYTES + 1, "any key fits");

constexpr size_t MAX_FILTERS = 1U << 20; // far beyond any use, and no size overflows

constexpr int LETTERS = 26;
constexpr int OTHER_SECTION = LETTERS; // '#', between the letters and the times
constexpr int TIMES = 5;
static_assert(OTHER_SECTION + 1 + TIMES == QV_MAX_SECTIONS, "every index character has a place");

// The data directory of the process, and how many indexes are open on it.
class CSharedRoot
{
public:
    // Takes the directory for one more index.
    static int Acquire(const char* szDirectory)
    {
        const std::unique_ptr<char, decltype(&std::free)> path(realpath(szDirectory, nullptr),
                                                               &std::free);
        if (path == nullptr)
        {
            return QV_ERROR_DIRECTORY;
        }
        const bool bTopmost = std::strcmp(path.get(), "/") == 0;
        const std::lock_guard<std::mutex> lock(s_mutex);
        if (s_iUsers > 0 && std::strcmp(path.get(), s_szRoot) != 0)
        {
            return QV_ERROR_OTHER_DIRECTORY;
        }
        if (s_iUsers == 0)
        {
            const size_t uSize = std::strlen(path.get()) + 1;
            if (uSize > sizeof(s_szRoot) || CDataPaths::SetRoot(bTopmost ? "" : path.get()) != 0)
            {
                return QV_ERROR_DIRECTORY;
            }
            std::memcpy(s_szRoot, path.get(), uSize);
        }
        ++s_iUsers;
        return QV_OK;
    }

    static void Release()
    {
        const std::lock_guard<std::mutex> lock(s_mutex);
        --s_iUsers;
    }

private:
    static std::mutex s_mutex;
    static int s_iUsers;
    static char s_szRoot[PATH_MAX];
};

std::mutex CSharedRoot::s_mutex;
int CSharedRoot::s_iUsers = 0;
char CSharedRoot::s_szRoot[PATH_MAX] = {};

bool IsReadable(const char* szPath)
{
    return access(szPath, R_OK) == 0;
}

int StatusOfBuild(int iResult)
{
    switch (iResult)
    {
    case 0:
        return QV_OK;
    case LOC_ERR_MAP:
        return QV_ERROR_PINYIN;
    default:
        return IsReadable(CDataPaths::Database()) ? QV_ERROR_STORE : QV_ERROR_DATABASE;
    }
}

// Names are converted before there is an index: the contacts database needs their keys.
void MakeMissingPinyinTable()
{
    if (access(CDataPaths::PinyinMapping(), F_OK) != 0)
    {
        CQVLocalizerManager::InitMapFile(); // a failure shows when the table is mapped
    }
}

// Decodes a whole text of at most iMaxUnits characters.
int DecodeShort(const char* szText, wchar_t* szTarget, int iMaxUnits)
{
    const int iUnits = DecodeText(szText, szTarget, iMaxUnits);
    if (iUnits < 0)
    {
        return QV_ERROR_UTF8;
    }
    return iUnits <= iMaxUnits ? QV_OK : QV_ERROR_TOO_LONG;
}

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
    // One more than filled: the library wants arrays even for no filter.
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

// The key of a name, which is checked already, with the table mapped at pMap.
void WriteKey(PYOFWORDS* pMap, const char* szName, char (&szKey)[QV_KEY_SIZE])
{
    wchar_t szCharacters[LOC_NAME_BUFFER] = {};
    DecodeText(szName, szCharacters, CONTACT_MAX_NAME);
    Ft2Jt(szCharacters);
    wchar_t szCodes[CONTACT_MAX_KEY + 1] = {};
    CQVLocalizerManager::TranslateNameToLocal(pMap, szCharacters, szCodes);
    EncodeText(szCodes, szKey, sizeof(szKey));
}

int CheckNames(const char* const* pszNames, size_t uCount)
{
    for (size_t i = 0; i < uCount; ++i)
    {
        wchar_t szNone[1];
        if (pszNames[i] == nullptr)
        {
            return QV_ERROR_ARGUMENT;
        }
        if (DecodeText(pszNames[i], szNone, 0) < 0)
        {
            return QV_ERROR_UTF8;
        }
    }
    return QV_OK;
}

#ifndef __ANDROID__
// The caller's log function, which the sink hands on to. Set with the same care as the sink.
qv_log_function g_pfnLog = nullptr;

void HandOn(void* pContext, int iPriority, const char* szTag, const char* szText)
{
    g_pfnLog(pContext, iPriority, szTag, szText);
}
#endif

} // namespace

struct qv_index
{
    CLocalizerLogic m_logic;
};

struct qv_result
{
    qv_result() = default;
    ~qv_result() { CMemManger().FreeSearchResult(m_pSet); }
    qv_result(const qv_result&) = delete;
    qv_result& operator=(const qv_result&) = delete;

    tag_LocalizerResult* m_pSet = nullptr;
    uint32_t m_uNextKeys = 0;
    bool m_bOfEmptyText = false;
    char m_szCandidates[CN_WORD_MAX * UTF8_MAX_BYTES + 1] = {};
};

const char* qv_strerror(int status)
{
    switch (status)
    {
    case QV_OK:
        return "success";
    case QV_ERROR_ARGUMENT:
        return "an argument is null or has no meaning";
    case QV_ERROR_MEMORY:
        return "out of memory";
    case QV_ERROR_UTF8:
        return "a text is not UTF-8";
    case QV_ERROR_TOO_LONG:
        return "a text has too many characters";
    case QV_ERROR_BUFFER:
        return "the buffer is too small";
    case QV_ERROR_DIRECTORY:
        return "the data directory does not exist or its path is too long";
    case QV_ERROR_OTHER_DIRECTORY:
        return "the process has another data directory open";
    case QV_ERROR_DATABASE:
        return "the contacts database does not exist or cannot be read";
    case QV_ERROR_PINYIN:
        return "the pinyin table does not exist or cannot be mapped";
    case QV_ERROR_STORE:
        return "the database or the index is locked, damaged or not writable";
    case QV_ERROR_CHARACTER:
        return "the pinyin table does not have the character";
    case QV_ERROR_NOT_BUILT:
        return "the index is not built";
    case QV_ERROR_PLATFORM:
        return "not to be had on this platform";
    default:
        return "no result of this library";
    }
}

int qv_set_log(qv_log_function callback, void* userdata)
{
#ifdef __ANDROID__
    static_cast<void>(callback);
    static_cast<void>(userdata);
    return QV_ERROR_PLATFORM;
#else
    g_pfnLog = callback;
    CLogSink::Set(callback != nullptr ? &HandOn : nullptr, userdata);
    return QV_OK;
#endif
}

int qv_open(const char* data_dir, qv_index** index)
{
    if (index == nullptr)
    {
        return QV_ERROR_ARGUMENT;
    }
    *index = nullptr;
    const int iResult = CSharedRoot::Acquire(data_dir != nullptr ? data_dir : PROVIDER_ROOT);
    if (iResult != QV_OK)
    {
        return iResult;
    }
    std::unique_ptr<qv_index> opened(new (std::nothrow) qv_index);
    if (opened == nullptr || !opened->m_logic.IsReady())
    {
        CSharedRoot::Release();
        return QV_ERROR_MEMORY;
    }
    *index = opened.release();
    return QV_OK;
}

void qv_close(qv_index* index)
{
    if (index != nullptr)
    {
        delete index;
        CSharedRoot::Release();
    }
}

int qv_needs_build(qv_index* index)
{
    return index != nullptr ? IsNeedReload() : QV_ERROR_ARGUMENT;
}

int qv_build(qv_index* index, int force)
{
    return index != nullptr ? StatusOfBuild(index->m_logic.MemInit(force != 0)) : QV_ERROR_ARGUMENT;
}

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

int qv_localizer_key(qv_index* index, const char* name, char* buffer, size_t size)
{
    if (buffer == nullptr)
    {
        return QV_ERROR_ARGUMENT;
    }
    char szKey[1][QV_KEY_SIZE];
    const int iStatus = qv_localizer_keys(index, &name, 1, szKey);
    if (iStatus != QV_OK)
    {
        return iStatus;
    }
    const size_t uBytes = std::strlen(szKey[0]) + 1;
    if (uBytes > size)
    {
        return QV_ERROR_BUFFER;
    }
    std::memcpy(buffer, szKey[0], uBytes);
    return QV_OK;
}

int qv_localizer_keys(qv_index* index, const char* const* names, size_t count,
                      char (*keys)[QV_KEY_SIZE])
{
    if (index == nullptr || ((names == nullptr || keys == nullptr) && count > 0))
    {
        return QV_ERROR_ARGUMENT;
    }
    const int iStatus = CheckNames(names, count);
    if (iStatus != QV_OK)
    {
        return iStatus;
    }
    MakeMissingPinyinTable();
    const CPinyinTable table;
    if (!table.IsOpen())
    {
        return QV_ERROR_PINYIN;
    }
    for (size_t i = 0; i < count; ++i)
    {
        WriteKey(table.Records(), names[i], keys[i]);
    }
    return QV_OK;
}

int qv_pick(qv_index* index, const char* text, int position, const char* word, char* buffer,
            size_t size)
{
    if (index == nullptr || text == nullptr || position < 0 || word == nullptr || buffer == nullptr)
    {
        return QV_ERROR_ARGUMENT;
    }
    wchar_t szText[QV_MAX_TYPED + 1] = {};
    wchar_t szWord[MAX_PICKED + 1] = {};
    int iStatus = DecodeShort(text, szText, QV_MAX_TYPED);
    if (iStatus == QV_OK)
    {
        iStatus = DecodeShort(word, szWord, MAX_PICKED);
    }
    if (iStatus != QV_OK)
    {
        return iStatus;
    }
    MakeMissingPinyinTable();
    if (!CPinyinTable().IsOpen())
    {
        return QV_ERROR_PINYIN;
    }
    wchar_t szOut[QV_MAX_TYPED + MAX_PICKED + 1] = {};
    if (index->m_logic.GetLocalizerString(szText, position, szWord, szOut) != 0)
    {
        return QV_ERROR_CHARACTER; // arguments and table are checked
    }
    return EncodeText(szOut, buffer, size) ? QV_OK : QV_ERROR_BUFFER;
}

int qv_contacts_changed(qv_index* index, const int64_t* ids, size_t count)
{
    if (index == nullptr || (ids == nullptr && count > 0) || count > INT_MAX)
    {
        return QV_ERROR_ARGUMENT;
    }
    // The notification uses its list up.
    const std::unique_ptr<long long[]> list(new (std::nothrow) long long[count]);
    if (list == nullptr)
    {
        return QV_ERROR_MEMORY;
    }
    std::copy_n(ids, count, list.get());
    index->m_logic.OnContactsTableChanged(static_cast<int>(count), list.get());
    return QV_OK;
}

int qv_all_contacts_changed(qv_index* index)
{
    if (index == nullptr)
    {
        return QV_ERROR_ARGUMENT;
    }
    index->m_logic.OnContactsTableChanged();
    return QV_OK;
}

int qv_status_changed(qv_index* index)
{
    if (index == nullptr)
    {
        return QV_ERROR_ARGUMENT;
    }
    index->m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    return QV_OK;
}

int qv_time_changed(qv_index* index, int32_t contact_id, int64_t time)
{
    if (index == nullptr)
    {
        return QV_ERROR_ARGUMENT;
    }
    index->m_logic.OnContactTimeChanged(contact_id, time);
    return QV_OK;
}

int qv_star_changed(qv_index* index, int32_t contact_id, int starred)
{
    if (index == nullptr)
    {
        return QV_ERROR_ARGUMENT;
    }
    index->m_logic.OnContactStarChanged(contact_id, starred != 0 ? 1 : 0);
    return QV_OK;
}

int qv_get_sort_type(qv_index* index)
{
    if (index == nullptr)
    {
        return QV_ERROR_ARGUMENT;
    }
    return index->m_logic.GetSortType() == STORE_ORDER_TIME ? QV_SORT_TIME : QV_SORT_NAME;
}

int qv_set_sort_type(qv_index* index, int sort_type)
{
    if (index == nullptr || (sort_type != QV_SORT_NAME && sort_type != QV_SORT_TIME))
    {
        return QV_ERROR_ARGUMENT;
    }
    // Without an index there is nowhere to keep it, and nothing tells.
    index->m_logic.SetSortType(sort_type);
    return IsReadable(CDataPaths::ContactReg()) && index->m_logic.GetSortType() == sort_type
               ? QV_OK
               : QV_ERROR_STORE;
}
