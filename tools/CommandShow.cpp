#include "Core/LocalizerLogic.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "MemManager/MemManger.h"
#include "tools/Commands.h"
#include "tools/DataDirectory.h"
#include "tools/LibraryLog.h"
#include "tools/OptionChecks.h"
#include "tools/RecordText.h"
#include "tools/ToolError.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <chrono>
#include <iostream>
#include <map>
#include <memory>
#include <thread>

namespace
{

constexpr int DEFAULT_LIMIT = 20;
constexpr int LOCK_ATTEMPTS = 5;
constexpr std::chrono::milliseconds LOCK_PAUSE(200);

struct tag_ShowOptions
{
    CDataDirectory directory;
    int iLimit = DEFAULT_LIMIT;
    std::string strOrder;
    std::string strNewOrder;
};

const std::map<std::string, int>& Orders()
{
    static const std::map<std::string, int> mapOrders = {{"name", STORE_ORDER_NAME},
                                                         {"time", STORE_ORDER_TIME}};
    return mapOrders;
}

std::string OrderText(int iSortType)
{
    switch (iSortType)
    {
    case STORE_ORDER_NAME:
        return "name order";
    case STORE_ORDER_TIME:
        return "order of last contact, latest first";
    default:
        return "unknown, acts as name order";
    }
}

// GetContactsResult waits for the lock without limit, which would look like a hang here.
void RequireUnlocked()
{
    CMemManger store;
    for (int i = 0; i < LOCK_ATTEMPTS; ++i)
    {
        if (store.LockMemo() == 1)
        {
            return; // released with the object
        }
        std::this_thread::sleep_for(LOCK_PAUSE);
    }
    throw CToolError(TOOL_EXIT_FAILED, CLibraryLog::LockReason(), "Try again when it is free.");
}

void RequireRead(const CLibraryLog& log)
{
    if (!log.Errors().empty())
    {
        throw CToolError(TOOL_EXIT_FAILED, log.WithReason("the index could not be read"),
                         BUILD_ANEW, log.Errors());
    }
}

// A private copy of the stored records.
class CStoredRecords
{
public:
    CStoredRecords()
    {
        const CLibraryLog log;
        CMemManger().GetContactsResult(&m_pInfo);
        if (m_pInfo == nullptr)
        {
            throw CToolError(TOOL_EXIT_FAILED, "no memory for the records");
        }
        RequireRead(log);
    }
    ~CStoredRecords()
    {
        delete[] m_pInfo->pContacts;
        delete m_pInfo;
    }
    CStoredRecords(const CStoredRecords&) = delete;
    CStoredRecords& operator=(const CStoredRecords&) = delete;

    int Count() const { return m_pInfo->RecordNum; }
    const tag_ContactsStruct& operator[](int iIndex) const { return m_pInfo->pContacts[iIndex]; }
    void Sort(int iSortType)
    {
        CQVLocalizerManager::LocalizerQuickSort(m_pInfo->pContacts, m_pInfo->RecordNum, iSortType);
    }

private:
    tag_ContactsInfo* m_pInfo = nullptr;
};

void PrintRegistration()
{
    const CLibraryLog log;
    CMemManger store;
    int iTotal = 0;
    const int iCapacity = store.GetMemSize(&iTotal);
    const int iSortType = store.GetSortType();
    RequireRead(log);
    std::cout << "Registration record\n"
              << "  iTotalNum  " << iTotal << " contacts\n"
              << "  iSortType  " << iSortType << " (" << OrderText(iSortType) << ")\n"
              << "  iMemSize   " << iCapacity
              << (iCapacity == 0 ? " (rebuilt at the next change)\n" : " records fit\n");
}

void PrintRecords(const tag_ShowOptions& options)
{
    CStoredRecords records;
    if (!options.strOrder.empty())
    {
        records.Sort(Orders().at(options.strOrder));
    }
    const int iShown =
        options.iLimit == 0 ? records.Count() : std::min(options.iLimit, records.Count());
    std::cout << "Records " << (options.strOrder.empty() ? "as stored" : "by " + options.strOrder)
              << ", " << iShown << " of " << records.Count() << '\n';
    PrintRecordHeading(std::cout);
    for (int i = 0; i < iShown; ++i)
    {
        PrintRecord(std::cout, records[i]);
    }
}

void SetOrder(const tag_ShowOptions& options)
{
    const int iSortType = Orders().at(options.strNewOrder);
    CLocalizerLogic().SetSortType(iSortType);
    if (CLocalizerLogic().GetSortType() != iSortType)
    {
        throw CToolError(TOOL_EXIT_FAILED, "the library could not store the order");
    }
    std::cout << "The records are put in this order by the next build: "
              << options.directory.CommandLine("index") << '\n';
}

void RunShow(const tag_ShowOptions& options)
{
    options.directory.Use();
    options.directory.RequireIndex();
    if (!options.strNewOrder.empty())
    {
        SetOrder(options);
    }
    RequireUnlocked();
    PrintRegistration();
    PrintRecords(options);
}

} // namespace

void AddShowCommand(CLI::App& app)
{
    auto pOptions = std::make_shared<tag_ShowOptions>();
    CLI::App* pCommand = app.add_subcommand("show", "Show what the index files hold");
    pOptions->directory.AddOption(*pCommand);
    pCommand->add_option("--limit", pOptions->iLimit, "Records to show, 0 for all")
        ->type_name("N")
        ->check(WholeNumber(0, MAX_INT))
        ->capture_default_str();
    pCommand
        ->add_option("--sort-type", pOptions->strOrder,
                     "Show the records by name or time instead of as they are stored")
        ->check(CLI::IsMember({"name", "time"}));
    pCommand
        ->add_option("--set-sort-type", pOptions->strNewOrder,
                     "Store the order, name or time, that the next build puts the records in")
        ->check(CLI::IsMember({"name", "time"}));
    pCommand->callback([pOptions] { RunShow(*pOptions); });
}
