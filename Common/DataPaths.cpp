#include "Common/DataPaths.h"

#include <cstdio>
#include <cstring>

namespace
{

// A macro, so that each device path is one literal.
#define QV_DEVICE_ROOT "/data/data/com.android.providers.contacts"

constexpr size_t MAX_ROOT = 4000;
constexpr size_t MAX_PATH = MAX_ROOT + 64;

enum PATH_INDEX
{
    PATH_DATABASE,
    PATH_PINYIN_SOURCE,
    PATH_PINYIN_MAPPING,
    PATH_CONTACT_RECORDS,
    PATH_CONTACT_REG,
    PATH_LOCK_FILE,
    PATH_COUNT
};

constexpr const char* DEVICE_PATHS[PATH_COUNT] = {
    QV_DEVICE_ROOT "/databases/contacts2.db",  QV_DEVICE_ROOT "/files/pyfile.bin",
    QV_DEVICE_ROOT "/files/PyFileMappint.bin", QV_DEVICE_ROOT "/files/ContactsLocalizer.bin",
    QV_DEVICE_ROOT "/files/ContactsReg.bin",   QV_DEVICE_ROOT "/files/memlock.ini",
};
constexpr size_t DEVICE_ROOT_LENGTH = sizeof(QV_DEVICE_ROOT) - 1;

char g_szPaths[PATH_COUNT][MAX_PATH];
bool g_bMoved = false;

const char* PathOf(PATH_INDEX eIndex)
{
    return g_bMoved ? g_szPaths[eIndex] : DEVICE_PATHS[eIndex];
}

} // namespace

int CDataPaths::SetRoot(const char* szRoot)
{
    if (szRoot == nullptr)
    {
        g_bMoved = false;
        return 0;
    }
    if (std::strlen(szRoot) > MAX_ROOT)
    {
        return -1;
    }
    for (int i = 0; i < PATH_COUNT; ++i)
    {
        std::snprintf(g_szPaths[i], MAX_PATH, "%s%s", szRoot, DEVICE_PATHS[i] + DEVICE_ROOT_LENGTH);
    }
    g_bMoved = true;
    return 0;
}

const char* CDataPaths::Database()
{
    return PathOf(PATH_DATABASE);
}
const char* CDataPaths::PinyinSource()
{
    return PathOf(PATH_PINYIN_SOURCE);
}
const char* CDataPaths::PinyinMapping()
{
    return PathOf(PATH_PINYIN_MAPPING);
}
const char* CDataPaths::ContactRecords()
{
    return PathOf(PATH_CONTACT_RECORDS);
}
const char* CDataPaths::ContactReg()
{
    return PathOf(PATH_CONTACT_REG);
}
const char* CDataPaths::LockFile()
{
    return PathOf(PATH_LOCK_FILE);
}
