// How long a keystroke, a build and a change take, beside what no implementation can beat.
//
// Every benchmark is one pass over its whole workload; the counters tell the result. Times in
// counters are microseconds; a "share" is a time divided by what it is allowed, so that 1 is the
// limit whatever machine runs it. bench/report.py turns the output into bench/README.md.

#include "Common/DataPaths.h"
#include "Core/LocalizerLogic.h"
#include "Filter/FilterChain.h"
#include "LocalizerImpl/QVNumLocalizerManager.h"
#include "LocalizerImpl/QVWordLocalizerManager.h"
#include "LocalizerImpl/SearchRun.h"
#include "MemManager/ContactSelection.h"
#include "MemManager/MemManger.h"
#include "bench/Floors.h"
#include "bench/LockWatch.h"
#include "bench/PeakMemory.h"
#include "bench/Queries.h"
#include "bench/Workload.h"
#include "tests/Support/ProviderDatabase.h"
#include "tools/Utf8Text.h"

#include <algorithm>
#include <benchmark/benchmark.h>
#include <map>
#include <memory>
#include <pthread.h>
#include <random>
#include <string>
#include <sys/mman.h>
#include <sys/time.h>
#include <sys/wait.h>
#include <unistd.h>
#include <utility>
#include <vector>

namespace
{

constexpr int SIZES[] = {1000, 10000, 100000};
constexpr int LARGEST = 100000;
constexpr int HUGE_SIZE = 1000000; // measured on request
constexpr int HUGE_RUNS = 3;       // of each of its keystrokes
constexpr double MICROSECONDS = 1e6;
constexpr double MIB = 1024.0 * 1024.0;
constexpr int WORD_BUFFER = 64;
constexpr int INPUT_BUFFER = 16;

// The workloads are large: one stands at a time.
CWorkload& WorkloadOf(int iContacts, wchar_t surname = 0)
{
    static std::unique_ptr<CWorkload> pWorkload;
    if (pWorkload == nullptr || pWorkload->Contacts() != iContacts ||
        pWorkload->Surname() != surname)
    {
        pWorkload.reset();
        pWorkload = std::make_unique<CWorkload>(iContacts, surname);
    }
    return *pWorkload;
}

struct tag_Keystroke
{
    const tag_Query* pQuery;
    size_t uTyped;
    int iBefore; // entries searched in
    int iAfter;  // entries found
    double dSeconds;
    size_t uPeakBytes;
    double dScan;       // what reading an entry takes in these moments
    double dEntries;    // what copying the entries found takes in these moments
    double dAllowed;    // 95 of 100 keystrokes
    double dAllowedMax; // all of them
};

double Percentile(std::vector<double> vValues, int iPercent)
{
    std::sort(vValues.begin(), vValues.end());
    const size_t uIndex = (vValues.size() * static_cast<size_t>(iPercent) + 99) / 100;
    return vValues[std::max<size_t>(uIndex, 1) - 1];
}

// Searches the store, or a previous result, among the contacts that the chain keeps.
tag_LocalizerResult* SearchKept(CLocalizerLogic& logic, IME_SEARCH_TYPE eType,
                                const std::wstring& strText, tag_LocalizerResult* pPrevious,
                                CFilterChain& chain)
{
    wchar_t szInput[INPUT_BUFFER] = {};
    std::copy(strText.begin(), strText.end(), szInput);
    wchar_t szWords[WORD_BUFFER] = {};
    long lMask = 0;
    tag_LocalizerResult* pResult = nullptr;
    logic.Search(pPrevious, szInput, eType, &chain, 0, &pResult, &lMask, szWords);
    return pResult;
}

// The same for everybody.
tag_LocalizerResult* SearchAll(CLocalizerLogic& logic, IME_SEARCH_TYPE eType,
                               const std::wstring& strText, tag_LocalizerResult* pPrevious)
{
    CFilterChain chain;
    return SearchKept(logic, eType, strText, pPrevious, chain);
}

// Types all queries key by key and measures every keystroke.
class CTypist
{
public:
    CTypist(bool bNarrow, int iContacts)
        : m_bNarrow(bNarrow), m_iRuns(iContacts > LARGEST ? HUGE_RUNS : MEASURE_RUNS)
    {
    }

    std::vector<tag_Keystroke> TypeAll()
    {
        std::vector<tag_Keystroke> vKeystrokes;
        for (const tag_Query& query : QUERIES)
        {
            Type(query, vKeystrokes);
        }
        return vKeystrokes;
    }

private:
    void Type(const tag_Query& query, std::vector<tag_Keystroke>& vKeystrokes)
    {
        const std::wstring strText = query.szText;
        tag_LocalizerResult* pPrevious = nullptr;
        if (m_bNarrow)
        {
            pPrevious = Search(query.eType, L"", nullptr);
            m_dScan = ScanFloor(pPrevious->iResultNum) / pPrevious->iResultNum;
        }
        for (size_t uTyped = m_bNarrow ? 1 : 0; uTyped <= strText.size(); ++uTyped)
        {
            const std::wstring strTyped = strText.substr(0, uTyped);
            vKeystrokes.push_back(Measure(query, strTyped, pPrevious));
            if (m_bNarrow)
            {
                tag_LocalizerResult* pNext = Search(query.eType, strTyped, pPrevious);
                m_logic.FreeSearchResult(pPrevious);
                pPrevious = pNext;
            }
        }
        m_logic.FreeSearchResult(pPrevious);
    }

    tag_Keystroke Measure(const tag_Query& query, const std::wstring& strTyped,
                          tag_LocalizerResult* pPrevious)
    {
        tag_LocalizerResult* pResult = nullptr;
        int iFound = 0;
        CPeakMemory::Restart();
        const double dSeconds = MedianSeconds(
            m_iRuns, [&] { pResult = Search(query.eType, strTyped, pPrevious); },
            [&]
            {
                iFound = pResult->iResultNum;
                m_logic.FreeSearchResult(pResult);
            });
        const int iBefore = pPrevious == nullptr ? 0 : pPrevious->iResultNum;
        const size_t uPeak = CPeakMemory::PeakBytes();
        return {&query,  strTyped.size(),      iBefore, iFound, dSeconds, uPeak,
                m_dScan, EntriesFloor(iFound), 0,       0};
    }

    tag_LocalizerResult* Search(IME_SEARCH_TYPE eType, const std::wstring& strText,
                                tag_LocalizerResult* pPrevious)
    {
        return SearchAll(m_logic, eType, strText, pPrevious);
    }

    bool m_bNarrow;
    int m_iRuns;
    double m_dScan = 0;
    CLocalizerLogic m_logic;
};

// Time of the selection alone for the first character of a text.
double SelectionSeconds(const tag_Query& query)
{
    CMemManger manager;
    CFilterChain chain;
    tag_LocalizerResult* pResult = nullptr;
    return MedianSeconds(
        MEASURE_RUNS,
        [&]
        {
            CQVWordLocalizerManager words(1);
            CQVNumLocalizerManager digits(1);
            CQVLocalizerManager& matcher =
                query.eType == IME_SEARCH_NUM ? static_cast<CQVLocalizerManager&>(digits) : words;
            CSearchRun run(matcher);
            wchar_t szInput[] = {query.szText[0], 0};
            run.Begin(szInput);
            bool bDense = false;
            CContactSelection::Copy(chain, &run, &pResult, &bDense);
        },
        [&] { manager.FreeSearchResult(pResult); });
}

void CountKeystrokes(benchmark::State& state, const std::vector<tag_Keystroke>& vKeystrokes,
                     int iContacts)
{
    std::vector<double> vTimes;
    std::vector<double> vShares;
    double dMaxShare = 0;
    for (const tag_Keystroke& key : vKeystrokes)
    {
        vTimes.push_back(key.dSeconds * MICROSECONDS);
        vShares.push_back(key.dSeconds / key.dAllowed);
        dMaxShare = std::max(dMaxShare, key.dSeconds / key.dAllowedMax);
    }
    const auto worst =
        std::max_element(vKeystrokes.begin(), vKeystrokes.end(),
                         [](const tag_Keystroke& a, const tag_Keystroke& b)
                         { return a.dSeconds / a.dAllowed < b.dSeconds / b.dAllowed; });
    const std::string strWorst = Utf8Text(std::wstring(worst->pQuery->szText, worst->uTyped));
    state.SetLabel("worst share: " + strWorst + ", " + std::to_string(worst->iAfter) + " found");
    state.counters["keystrokes"] = static_cast<double>(vKeystrokes.size());
    state.counters["p50_us"] = Percentile(vTimes, 50);
    state.counters["p95_us"] = Percentile(vTimes, 95);
    state.counters["max_us"] = Percentile(vTimes, 100);
    state.counters["p50_ns_per_contact"] = Percentile(vTimes, 50) * 1000 / iContacts;
    state.counters["p50_share"] = Percentile(vShares, 50);
    state.counters["p95_share"] = Percentile(vShares, 95);
    state.counters["max_share"] = dMaxShare;
}

// Allowed beside touching the store: p50 2 touches and 1.2 copies of the entries, p95 3 and 1.5;
// small stores 3 touches, 1.2 copies and 40 us.
void CountTouchShares(benchmark::State& state, const std::vector<tag_Keystroke>& vKeystrokes,
                      int iContacts)
{
    const double dTouch = TouchFloor(iContacts);
    const bool bLargest = iContacts >= LARGEST;
    std::vector<double> vMedian;
    std::vector<double> vMost;
    for (const tag_Keystroke& key : vKeystrokes)
    {
        const double dAllowed =
            bLargest ? 2 * dTouch + 1.2 * key.dEntries : 3 * dTouch + 1.2 * key.dEntries + 40e-6;
        vMedian.push_back(key.dSeconds / dAllowed);
        vMost.push_back(key.dSeconds / (3 * dTouch + 1.5 * key.dEntries));
    }
    state.counters["touch_us"] = dTouch * MICROSECONDS;
    state.counters["touch_p50_share"] = Percentile(vMedian, 50);
    state.counters["touch_p95_share"] = Percentile(vMost, 95);
}

// Allowed: 1.5 copies of the store and two of the entries, 2.5 copies for the slowest; small stores
// 2 copies and 100 us.
void WholeStore(benchmark::State& state)
{
    const int iContacts = static_cast<int>(state.range(0));
    WorkloadOf(iContacts);
    for (auto _ : state)
    {
        const double dCopy = CopyFloor(iContacts);
        const double dBase = iContacts >= LARGEST ? 1.5 * dCopy : 2 * dCopy + 100e-6;
        std::vector<tag_Keystroke> vKeystrokes = CTypist(false, iContacts).TypeAll();
        double dMemory = 0;
        for (tag_Keystroke& key : vKeystrokes)
        {
            key.dAllowed = dBase + 2 * key.dEntries;
            key.dAllowedMax = std::max(dBase, 2.5 * dCopy) + 2 * key.dEntries;
            const double dAllowedBytes = iContacts * 176.0 + key.iAfter * 136.0 + MIB;
            dMemory = std::max(dMemory, static_cast<double>(key.uPeakBytes) / dAllowedBytes);
        }
        CountKeystrokes(state, vKeystrokes, iContacts);
        std::vector<double> vNet;
        for (const tag_Keystroke& key : vKeystrokes)
        {
            vNet.push_back(key.dSeconds - key.dEntries);
        }
        state.counters["worst_to_median"] = Percentile(vNet, 100) / Percentile(vNet, 50);
        state.counters["memory_share"] = dMemory;
        state.counters["copy_us"] = dCopy * MICROSECONDS;
        CountTouchShares(state, vKeystrokes, iContacts);
    }
}

// The selection of a whole-store keystroke, which is nearly all done under the store lock. Allowed:
// what the lock would be held for to copy the records out, into memory of their own.
void LockHeld(benchmark::State& state)
{
    const int iContacts = static_cast<int>(state.range(0));
    WorkloadOf(iContacts);
    for (auto _ : state)
    {
        const double dCopy = CopyFreshFloor(iContacts);
        std::vector<double> vTimes;
        for (const tag_Query& query : QUERIES)
        {
            vTimes.push_back(SelectionSeconds(query) * MICROSECONDS);
        }
        state.counters["held_p50_us"] = Percentile(vTimes, 50);
        state.counters["held_max_us"] = Percentile(vTimes, 100);
        state.counters["copy_us"] = CopyFloor(iContacts) * MICROSECONDS;
        state.counters["copy_fresh_us"] = dCopy * MICROSECONDS;
        state.counters["lock_share"] = Percentile(vTimes, 100) / (dCopy * MICROSECONDS);
    }
}

// Allowed: 6 scans of the previous result, two copies of the new entries and 50 us.
void Narrowed(benchmark::State& state)
{
    const int iContacts = static_cast<int>(state.range(0));
    WorkloadOf(iContacts);
    for (auto _ : state)
    {
        std::vector<tag_Keystroke> vKeystrokes = CTypist(true, iContacts).TypeAll();
        for (tag_Keystroke& key : vKeystrokes)
        {
            key.dAllowed = 6 * key.dScan * key.iBefore + 2 * key.dEntries + 50e-6;
            key.dAllowedMax = key.dAllowed;
        }
        CountKeystrokes(state, vKeystrokes, iContacts);
        std::vector<double> vTight;
        double dSlowText = 0; // of the text with the most splits per name
        for (const tag_Keystroke& key : vKeystrokes)
        {
            const double dAllowed = 4 * key.dScan * key.iBefore + 1.5 * key.dEntries + 40e-6;
            vTight.push_back(key.dSeconds / dAllowed);
            if (std::wstring(key.pQuery->szText) == L"9494949494")
            {
                dSlowText = std::max(dSlowText, vTight.back());
            }
        }
        state.counters["slow_text_share"] = dSlowText;
        state.counters["tight_p95_share"] = Percentile(vTight, 95);
        const double dCopy = CopyFloor(iContacts) * MICROSECONDS;
        state.counters["copy_us"] = dCopy;
        state.counters["median_share"] = state.counters["p50_us"] / (dCopy / 20);
    }
}

// The first character of every text with filters that keep everybody. Allowed: 1.5 times the same
// without a filter.
void Filtered(benchmark::State& state)
{
    const int iContacts = static_cast<int>(state.range(0));
    WorkloadOf(iContacts);
    CProviderDatabase().Execute("update contacts set starred=1");
    const std::pair<const char*, int> KINDS[] = {{"plain", 0},
                                                 {"starred", FILTER_FAVOURITES},
                                                 {"id", FILTER_CONTACT_ID_EXPAND},
                                                 {"group", FILTER_GROUP_EXPAND}};
    for (auto _ : state)
    {
        CLocalizerLogic logic;
        logic.OnContactsTableChanged();
        std::map<int, double> medians;
        for (const auto& [szKind, iKind] : KINDS)
        {
            std::vector<double> vTimes;
            for (const tag_Query& query : QUERIES)
            {
                CFilterChain* pChain = nullptr;
                int iType = iKind;
                QVLong32 lNobody = -1;
                CMemManger().CreateFilterChain(&iType, &lNobody, iKind != 0 ? 1 : 0, &pChain);
                const std::unique_ptr<CFilterChain> chain(pChain);
                tag_LocalizerResult* pResult = nullptr;
                const auto search = [&] {
                    pResult = SearchKept(logic, query.eType, std::wstring(query.szText, 1), nullptr,
                                         *chain);
                };
                const auto release = [&] { logic.FreeSearchResult(pResult); };
                vTimes.push_back(MedianSeconds(MEASURE_RUNS, search, release));
            }
            medians[iKind] = Percentile(vTimes, 50);
            state.counters[std::string(szKind) + "_us"] = medians[iKind] * MICROSECONDS;
            state.counters[std::string(szKind) + "_share"] = medians[iKind] / (1.5 * medians[0]);
        }
    }
}

// A search that finds no reading sets in the cache, as the first one of a process.
void ColdSearch(benchmark::State& state)
{
    const int iContacts = static_cast<int>(state.range(0));
    WorkloadOf(iContacts);
    for (auto _ : state)
    {
        CLocalizerLogic logic;
        time_t iTime = 1;
        const auto forget = [&iTime]
        {
            const timeval changed = {iTime++, 0};
            const timeval times[] = {changed, changed};
            utimes(CDataPaths::PinyinMapping(), times);
        };
        forget();
        tag_LocalizerResult* pResult = nullptr;
        const double dSeconds = MedianSeconds(
            MEASURE_RUNS, [&] { pResult = SearchAll(logic, IME_SEARCH_WORD, L"z", nullptr); },
            [&]
            {
                logic.FreeSearchResult(pResult);
                forget();
            });
        state.counters["cold_us"] = dSeconds * MICROSECONDS;
        state.counters["cold_share"] = dSeconds / 1e-3;
    }
}

// Contacts of one surname, typed by its initial, so that all of them match and are ranked: in the
// whole store, and in a result that came in another order. Beside sorting as many matches.
void OneSurname(benchmark::State& state)
{
    const int iContacts = static_cast<int>(state.range(0));
    WorkloadOf(iContacts, L'\u5F20');
    for (auto _ : state)
    {
        CLocalizerLogic logic;
        tag_LocalizerResult* pResult = nullptr;
        tag_LocalizerResult* pPrevious = nullptr;
        const auto release = [&] { logic.FreeSearchResult(pResult); };
        const auto measure = [&](const char* szCounter, const wchar_t* szText)
        {
            const auto search = [&]
            { pResult = SearchAll(logic, IME_SEARCH_WORD, szText, pPrevious); };
            state.counters[szCounter] = MedianSeconds(MEASURE_RUNS, search, release) * MICROSECONDS;
        };
        measure("whole_us", L"z");
        pPrevious = SearchAll(logic, IME_SEARCH_WORD, L"", nullptr);
        std::mt19937 rng(1);
        std::shuffle(pPrevious->pDetail, pPrevious->pDetail + pPrevious->iResultNum, rng);
        measure("shuffled_us", L"z");
        logic.FreeSearchResult(pPrevious);
        state.counters["sort_us"] = SortFloor(iContacts) * MICROSECONDS;
        state.counters["entries_us"] = EntriesFloor(iContacts) * MICROSECONDS;
    }
}

// Allowed: 1.8 times reading the database, copying to fresh memory and rewriting the file.
void Build(benchmark::State& state)
{
    const int iContacts = static_cast<int>(state.range(0));
    WorkloadOf(iContacts);
    for (auto _ : state)
    {
        CLocalizerLogic logic;
        const double dFloor = SqlFloor() + CopyFreshFloor(iContacts) + RewriteFloor(iContacts);
        const double dSeconds = MedianSeconds(3, [&] { logic.MemInit(true); });
        state.counters["build_us"] = dSeconds * MICROSECONDS;
        state.counters["floor_us"] = dFloor * MICROSECONDS;
        state.counters["build_share"] = dSeconds / (1.8 * dFloor);
    }
}

// One contact changed in the database and then in the store. Allowed: the count query and 1.5
// copies when it is renewed in place, 6 copies when records move.
void Changes(benchmark::State& state)
{
    constexpr int CHANGED_ID = 4711;
    const int iContacts = static_cast<int>(state.range(0));
    WorkloadOf(iContacts);
    for (auto _ : state)
    {
        CLocalizerLogic logic;
        CProviderDatabase database;
        const int iId = CHANGED_ID % iContacts + 1;
        const auto notify = [&]
        {
            long long llId = iId;
            logic.OnContactsTableChanged(1, &llId);
        };
        const auto share = [&](const char* szCounter, double dSeconds, double dCopies)
        {
            const double dAllowed = CountQueryFloor() + dCopies * CopyFloor(iContacts);
            state.counters[std::string(szCounter) + "_us"] = dSeconds * MICROSECONDS;
            state.counters[std::string(szCounter) + "_share"] = dSeconds / dAllowed;
        };
        int iRound = 0;
        share("renewed", MedianSeconds(MEASURE_RUNS, notify), 1.5);
        share("renamed",
              MedianSeconds(MEASURE_RUNS, notify,
                            [&] { database.SetName(iId, iRound++ % 2 == 0 ? "aa" : "zz", ""); }),
              6);
        std::vector<double> vRemoved;
        std::vector<double> vInserted;
        for (int i = 0; i < MEASURE_RUNS; ++i)
        {
            database.SetVisible(iId, false);
            vRemoved.push_back(MedianSeconds(1, notify));
            database.SetVisible(iId, true);
            vInserted.push_back(MedianSeconds(1, notify));
        }
        share("removed", Percentile(vRemoved, 50), 6);
        share("inserted", Percentile(vInserted, 50), 6);
    }
}

// As many contacts as one notification lists, spread over the store, changed in the database and
// then in the store. Allowed: to hold the lock for 4 copies.
void ManyChanges(benchmark::State& state)
{
    constexpr int CHANGES = 200;
    const int iContacts = static_cast<int>(state.range(0));
    WorkloadOf(iContacts);
    const int iDistance = iContacts / CHANGES;
    const std::string strEvery = "%" + std::to_string(iDistance) + "=1";
    // Names all over the store that differ from round to round.
    const auto rename = [&](int iRound)
    {
        return "update localizer set display_name=char(97+(contact_id/" +
               std::to_string(iDistance) + "*7+" + std::to_string(iRound) +
               ")%26)||contact_id where contact_id" + strEvery;
    };
    const std::pair<std::string, std::string> changes[] = {
        {"renewed", "update contacts set starred=1-starred where _id" + strEvery},
        {"removed", "delete from visible_contacts where _id" + strEvery},
        {"inserted", "insert into visible_contacts select _id from contacts where _id" + strEvery},
        {"renamed", rename(0)},
        {"renamed", rename(11)}};
    for (auto _ : state)
    {
        CLocalizerLogic logic;
        CProviderDatabase database;
        std::map<std::string, std::vector<double>> held;
        for (int iRun = 0; iRun < MEASURE_RUNS; ++iRun)
        {
            for (const auto& [strKind, strSql] : changes)
            {
                database.Execute(strSql);
                std::vector<long long> vIds;
                for (int i = 0; i < CHANGES; ++i)
                {
                    vIds.push_back(1 + i * iDistance);
                }
                const CLockWatch watch;
                logic.OnContactsTableChanged(CHANGES, vIds.data());
                held[strKind].push_back(watch.Held());
            }
        }
        const double dCopy = CopyFloor(iContacts);
        for (const auto& [strKind, vHeld] : held)
        {
            state.counters[strKind + "_us"] = Percentile(vHeld, 50) * MICROSECONDS;
            state.counters[strKind + "_share"] = Percentile(vHeld, 50) / (4 * dCopy);
        }
        state.counters["copy_us"] = dCopy * MICROSECONDS;
    }
}

// What two processes that type at once share: each key is pressed by both at the same moment.
struct tag_TypingTogether
{
    pthread_barrier_t nextKey;
    double dLongestHeld; // by the second process
};

// Types all texts that search the store, key by key, with the other process.
void TypeTogether(tag_TypingTogether* pTogether)
{
    CLocalizerLogic logic;
    for (const tag_Query& query : QUERIES)
    {
        const std::wstring strText = query.szText;
        for (size_t uTyped = 1; query.eType != IME_SEARCH_SPECIAL && uTyped <= strText.size();
             ++uTyped)
        {
            pthread_barrier_wait(&pTogether->nextKey);
            tag_LocalizerResult* pResult =
                SearchAll(logic, query.eType, strText.substr(0, uTyped), nullptr);
            logic.FreeSearchResult(pResult);
        }
    }
}

// Two processes that always meet at the lock. Allowed: to wait for 3 times the longest that the
// other one holds it.
void TwoTypists(benchmark::State& state)
{
    const int iContacts = static_cast<int>(state.range(0));
    WorkloadOf(iContacts);
    auto* pTogether = static_cast<tag_TypingTogether*>(mmap(nullptr, sizeof(tag_TypingTogether),
                                                            PROT_READ | PROT_WRITE,
                                                            MAP_SHARED | MAP_ANONYMOUS, -1, 0));
    pthread_barrierattr_t attributes;
    pthread_barrierattr_init(&attributes);
    pthread_barrierattr_setpshared(&attributes, PTHREAD_PROCESS_SHARED);
    pthread_barrier_init(&pTogether->nextKey, &attributes, 2);
    for (auto _ : state)
    {
        const pid_t iOther = fork();
        const CLockWatch watch;
        TypeTogether(pTogether);
        if (iOther == 0)
        {
            pTogether->dLongestHeld = watch.LongestHeld();
            _exit(0);
        }
        waitpid(iOther, nullptr, 0);
        state.counters["wait_us"] = watch.LongestWait() * MICROSECONDS;
        state.counters["held_us"] = pTogether->dLongestHeld * MICROSECONDS;
        state.counters["wait_share"] = watch.LongestWait() / (3 * pTogether->dLongestHeld);
    }
    pthread_barrier_destroy(&pTogether->nextKey);
    munmap(pTogether, sizeof(*pTogether));
}

void Floors(benchmark::State& state)
{
    const int iContacts = static_cast<int>(state.range(0));
    WorkloadOf(iContacts);
    for (auto _ : state)
    {
        state.counters["copy_us"] = CopyFloor(iContacts) * MICROSECONDS;
        state.counters["copy_fresh_us"] = CopyFreshFloor(iContacts) * MICROSECONDS;
        state.counters["touch_us"] = TouchFloor(iContacts) * MICROSECONDS;
        state.counters["scan_us"] = ScanFloor(iContacts) * MICROSECONDS;
        state.counters["entries_us"] = EntriesFloor(iContacts) * MICROSECONDS;
        state.counters["sql_us"] = SqlFloor() * MICROSECONDS;
        state.counters["rewrite_us"] = RewriteFloor(iContacts) * MICROSECONDS;
    }
}

struct tag_Benchmark
{
    const char* szName;
    void (*pfnRun)(benchmark::State&);
};

void Register(int iSize, std::initializer_list<tag_Benchmark> benchmarks)
{
    for (const tag_Benchmark& row : benchmarks)
    {
        benchmark::RegisterBenchmark(row.szName, row.pfnRun)
            ->Arg(iSize)
            ->Iterations(1)
            ->Unit(benchmark::kMillisecond);
    }
}

void RegisterAll()
{
    for (const int iSize : SIZES)
    {
        Register(iSize, {{"floors", Floors},
                         {"whole_store", WholeStore},
                         {"lock_held", LockHeld},
                         {"narrowed", Narrowed},
                         {"build", Build},
                         {"changes", Changes},
                         {"many_changes", ManyChanges},
                         {"two_typists", TwoTypists},
                         {"cold", ColdSearch},
                         {"filtered", Filtered}});
    }
    for (const int iSize : SIZES)
    {
        Register(iSize, {{"one_surname", OneSurname}});
    }
}

void RegisterLarge()
{
    for (const int iSize : {LARGEST, HUGE_SIZE})
    {
        Register(iSize, {{"floors", Floors},
                         {"whole_store", WholeStore},
                         {"lock_held", LockHeld},
                         {"narrowed", Narrowed},
                         {"build", Build},
                         {"changes", Changes}});
    }
}

} // namespace

// --large: 1,000,000 contacts beside 100,000.
int main(int argc, char** argv)
{
    const bool bLarge = argc > 1 && std::string(argv[1]) == "--large";
    argc -= bLarge ? 1 : 0;
    argv += bLarge ? 1 : 0;
    benchmark::Initialize(&argc, argv);
    bLarge ? RegisterLarge() : RegisterAll();
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}
