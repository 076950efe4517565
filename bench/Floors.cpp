#include "bench/Floors.h"

#include "Common/DataPaths.h"
#include "Core/Records/ContactRecords.h"
#include "Core/Records/SearchRecords.h"
#include "MemManager/Files/MappingGuards.h"

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstring>
#include <random>
#include <sqlite3.h>
#include <stdexcept>
#include <string>
#include <sys/mman.h>
#include <vector>

namespace
{

using Clock = std::chrono::steady_clock;

// What is read must not be optimised away.
volatile uint64_t g_uSink = 0;

constexpr const char* VISIBLE = " from contacts where cast(exists(select _id from visible_contacts "
                                "where contacts._id = visible_contacts._id ) as integer)=1";

size_t RecordBytes(int iContacts)
{
    return static_cast<size_t>(iContacts) * sizeof(tag_ContactsStruct);
}

size_t EntryBytes(int iEntries)
{
    return static_cast<size_t>(iEntries) * sizeof(tag_LocalizerDetail);
}

// Memory that no one has touched.
class CFreshMemory
{
public:
    explicit CFreshMemory(size_t uSize)
        : m_uSize(uSize),
          m_pAddr(mmap(nullptr, uSize, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0))
    {
        if (m_pAddr == MAP_FAILED)
        {
            throw std::runtime_error("no memory for a floor");
        }
    }
    ~CFreshMemory() { munmap(m_pAddr, m_uSize); }
    CFreshMemory(const CFreshMemory&) = delete;
    CFreshMemory& operator=(const CFreshMemory&) = delete;

    void* Get() const { return m_pAddr; }

private:
    size_t m_uSize;
    void* m_pAddr;
};

void CopyStore(int iContacts, void* pTarget)
{
    const CReadMapping store(CDataPaths::ContactRecords(), RecordBytes(iContacts));
    std::memcpy(pTarget, store.As<char>(), RecordBytes(iContacts));
}

void StepThrough(sqlite3* pDB, const std::string& strSql)
{
    sqlite3_stmt* pStatement = nullptr;
    if (sqlite3_prepare_v2(pDB, strSql.c_str(), -1, &pStatement, nullptr) != SQLITE_OK)
    {
        throw std::runtime_error(sqlite3_errmsg(pDB));
    }
    uint64_t uSum = 0;
    while (sqlite3_step(pStatement) == SQLITE_ROW)
    {
        for (int i = 0; i < sqlite3_column_count(pStatement); ++i)
        {
            uSum += sqlite3_column_type(pStatement, i) == SQLITE_TEXT
                        ? sqlite3_column_text(pStatement, i)[0]
                        : static_cast<uint64_t>(sqlite3_column_int64(pStatement, i));
        }
    }
    g_uSink = uSum;
    sqlite3_finalize(pStatement);
}

double StatementsFloor(const std::vector<std::string>& vStatements)
{
    return MedianSeconds(3,
                         [&]
                         {
                             sqlite3* pDB = nullptr;
                             sqlite3_open(CDataPaths::Database(), &pDB);
                             for (const std::string& strSql : vStatements)
                             {
                                 StepThrough(pDB, strSql);
                             }
                             sqlite3_close(pDB);
                         });
}

} // namespace

double MedianSeconds(int iRuns, const std::function<void()>& fnWork,
                     const std::function<void()>& fnAfter)
{
    std::vector<double> vSeconds;
    for (int i = 0; i < iRuns; ++i)
    {
        const Clock::time_point start = Clock::now();
        fnWork();
        vSeconds.push_back(std::chrono::duration<double>(Clock::now() - start).count());
        if (fnAfter)
        {
            fnAfter();
        }
    }
    std::sort(vSeconds.begin(), vSeconds.end());
    return vSeconds[vSeconds.size() / 2];
}

double CopyFloor(int iContacts)
{
    std::vector<char> vTarget(RecordBytes(iContacts), 1);
    return MedianSeconds(MEASURE_RUNS, [&] { CopyStore(iContacts, vTarget.data()); });
}

double TouchFloor(int iContacts)
{
    return MedianSeconds(MEASURE_RUNS,
                         [&]
                         {
                             const CReadMapping store(CDataPaths::ContactRecords(),
                                                      RecordBytes(iContacts));
                             const auto* pRecords = store.As<tag_ContactsStruct>();
                             uint64_t uSum = 0;
                             for (int i = 0; i < iContacts; ++i)
                             {
                                 uint64_t uBytes = 0;
                                 std::memcpy(&uBytes, pRecords[i].szLocalizerKey, sizeof(uBytes));
                                 uSum += uBytes;
                             }
                             g_uSink = uSum;
                         });
}

double CopyFreshFloor(int iContacts)
{
    return MedianSeconds(MEASURE_RUNS,
                         [&]
                         {
                             const CFreshMemory target(RecordBytes(iContacts));
                             CopyStore(iContacts, target.Get());
                         });
}

double ScanFloor(int iEntries)
{
    const std::vector<uint64_t> vEntries(EntryBytes(iEntries) / sizeof(uint64_t), 1);
    return MedianSeconds(MEASURE_RUNS,
                         [&]
                         {
                             uint64_t uSum = 0;
                             for (const uint64_t uWord : vEntries)
                             {
                                 uSum += uWord;
                             }
                             g_uSink = uSum;
                         });
}

double EntriesFloor(int iEntries)
{
    if (iEntries == 0)
    {
        return 0;
    }
    const std::vector<char> vEntries(EntryBytes(iEntries), 1);
    return MedianSeconds(MEASURE_RUNS,
                         [&]
                         {
                             const CFreshMemory target(EntryBytes(iEntries));
                             std::memcpy(target.Get(), vEntries.data(), vEntries.size());
                         });
}

double SortFloor(int iMatches)
{
    std::vector<_MatchResult> vMatches(static_cast<size_t>(iMatches));
    std::mt19937 rng(1);
    const auto shuffle = [&]
    {
        for (_MatchResult& match : vMatches)
        {
            match.iIndex = static_cast<int32_t>(rng());
        }
    };
    shuffle();
    return MedianSeconds(
        MEASURE_RUNS,
        [&]
        {
            std::sort(vMatches.begin(), vMatches.end(),
                      [](const _MatchResult& a, const _MatchResult& b)
                      { return a.iIndex < b.iIndex; });
        },
        shuffle);
}

double SqlFloor()
{
    return StatementsFloor(
        {std::string("select count(*)") + VISIBLE,
         std::string("select _id,times_contacted,starred,has_phone_number,last_time_contacted,"
                     "single_is_secret,photo_file_id,status_update_id ") +
             VISIBLE,
         "select contact_id,display_name,localizerkey,group_id,account_id,hasMail,hasAddress from "
         "localizer",
         "select status_update_data_id from status_updates where status='online'"});
}

double CountQueryFloor()
{
    return StatementsFloor({std::string("select count(*)") + VISIBLE});
}

double RewriteFloor(int iContacts)
{
    const std::vector<char> vRecords(RecordBytes(iContacts), 1);
    const std::string strFile = std::string(CDataPaths::ContactRecords()) + ".floor";
    CWriteMapping(strFile.c_str(), RecordBytes(iContacts)).Close(1);
    const double dSeconds =
        MedianSeconds(MEASURE_RUNS,
                      [&]
                      {
                          CWriteMapping mapping(strFile.c_str(), RecordBytes(iContacts));
                          std::memcpy(mapping.As<char>(), vRecords.data(), vRecords.size());
                      });
    std::remove(strFile.c_str());
    return dSeconds;
}
