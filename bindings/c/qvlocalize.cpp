// The index behind the C interface: its directory, builds and notifications; the descriptions of
// results and the log.

#include "Common/DataPaths.h"
#include "bindings/c/Objects.h"
#ifndef __ANDROID__
#include "Platform/LogSink.h"
#endif

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <mutex>
#include <new>
#include <unistd.h>

static_assert(QV_SORT_NAME == STORE_ORDER_NAME && QV_SORT_TIME == STORE_ORDER_TIME,
              "passed on as they are");

namespace
{

constexpr const char* PROVIDER_ROOT = "/data/data/com.android.providers.contacts";

// The data directory of the process, and how many indexes are open on it.
class CSharedRoot
{
public:
    // Registers one more index on the directory.
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

#ifndef __ANDROID__
// The caller's log function, which the sink calls. Not synchronised, like the sink.
qv_log_function g_pfnLog = nullptr;

void HandOn(void* pContext, int iPriority, const char* szTag, const char* szText)
{
    g_pfnLog(pContext, iPriority, szTag, szText);
}
#endif

} // namespace

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

int qv_contacts_changed(qv_index* index, const int64_t* ids, size_t count)
{
    if (index == nullptr || (ids == nullptr && count > 0) || count > INT_MAX)
    {
        return QV_ERROR_ARGUMENT;
    }
    // The notification modifies its list.
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
    // Without an index the library does nothing and reports nothing.
    index->m_logic.SetSortType(sort_type);
    return IsReadable(CDataPaths::ContactReg()) && index->m_logic.GetSortType() == sort_type
               ? QV_OK
               : QV_ERROR_STORE;
}
