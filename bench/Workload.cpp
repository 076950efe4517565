#include "bench/Workload.h"

#include "Common/DataPaths.h"
#include "Core/LocalizerLogic.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "Platform/LogSink.h"
#include "bench/NameSource.h"
#include "tests/Support/ProviderDatabase.h"
#include "tools/Utf8Text.h"

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <stdexcept>
#include <thread>

namespace fs = std::filesystem;

namespace
{

constexpr uint64_t NAME_SEED = 20240229;
constexpr long long FIRST_TIME_MS = 1700000000000LL;
constexpr long long HOUR_MS = 3600000LL;
constexpr int TIME_STEPS = 8191;
constexpr int ONLINE_EVERY = 11;
constexpr int GROUPS = 12;
constexpr int ACCOUNTS = 3;
constexpr std::chrono::seconds SETTLING_TIME(3);

void Require(bool bDone, const char* szWhat)
{
    if (!bDone)
    {
        throw std::runtime_error(szWhat);
    }
}

// The provider's way to a name's key: an error line per call is part of it, and dropped here.
class CKeyMaker
{
public:
    CKeyMaker()
    {
        CLogSink::Set([](void*, int, const char*, const char*) {}, nullptr);
        Require(CQVLocalizerManager::InitMapFile() == 0, "no pinyin table");
        m_hMap = CQVLocalizerManager::CreatePinYinFileMapping();
        Require(m_hMap > 0, "the pinyin table cannot be mapped");
    }
    ~CKeyMaker()
    {
        CQVLocalizerManager::ReleasePinYinFileMapping(m_hMap);
        CLogSink::Set(nullptr, nullptr);
    }
    CKeyMaker(const CKeyMaker&) = delete;
    CKeyMaker& operator=(const CKeyMaker&) = delete;

    std::wstring KeyOf(std::wstring strName) const
    {
        wchar_t szKey[CONTACT_MAX_KEY + 1] = {};
        CQVLocalizerManager::GetLocalizerString(m_hMap, strName.data(), szKey);
        return szKey;
    }

private:
    long m_hMap = -1;
};

} // namespace

CWorkload::CWorkload(int iContacts, wchar_t surname) : m_iContacts(iContacts), m_surname(surname)
{
    std::string strTemplate = (fs::temp_directory_path() / "qv_bench_XXXXXX").string();
    Require(mkdtemp(strTemplate.data()) != nullptr, "no temporary directory");
    m_strRoot = strTemplate;
    fs::create_directory(m_strRoot + "/databases");
    fs::create_directory(m_strRoot + "/files");
    Activate();
    fs::copy_file(QV_PYFILE, CDataPaths::PinyinSource());
    FillDatabase();
    CLocalizerLogic logic;
    Require(logic.MemInit(true) == 0, "the index cannot be built");
    // Searches keep nothing of a table that was written just now; people search an older one.
    std::this_thread::sleep_for(SETTLING_TIME);
}

CWorkload::~CWorkload()
{
    std::error_code error;
    fs::remove_all(m_strRoot, error);
}

void CWorkload::Activate() const
{
    CDataPaths::SetRoot(m_strRoot.c_str());
}

void CWorkload::FillDatabase() const
{
    const CKeyMaker keys;
    CNameSource names(NAME_SEED);
    CProviderDatabase database;
    database.Execute("begin");
    for (int i = 1; i <= m_iContacts; ++i)
    {
        const std::wstring strName = m_surname == 0 ? names.Next() : names.NextOf(m_surname);
        tag_DatabaseContact contact;
        contact.llID = i;
        contact.strName = Utf8Text(strName);
        contact.strKey = Utf8Text(keys.KeyOf(strName));
        contact.strGroups = std::to_string(1 + i % GROUPS);
        contact.strAccounts = std::to_string(1 + i % ACCOUNTS);
        contact.llLastTimeContacted = FIRST_TIME_MS + (i * 7919LL % TIME_STEPS) * HOUR_MS;
        contact.llStatusUpdateID = i;
        contact.bPhone = true;
        contact.bStarred = i % GROUPS == 0;
        contact.strStatus = i % ONLINE_EVERY == 0 ? "online" : "";
        database.Put(contact);
    }
    database.Execute("commit");
}
