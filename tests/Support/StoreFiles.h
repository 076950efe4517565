#ifndef QV_TESTS_SUPPORT_STOREFILES_H
#define QV_TESTS_SUPPORT_STOREFILES_H

// The two files of the store of the library's present root, as bytes.

#include "Common/DataPaths.h"
#include "Core/Records/ContactRecords.h"
#include "tests/Support/DataDirectory.h"

#include <algorithm>
#include <cstring>
#include <string>
#include <vector>

using Records = std::vector<tag_ContactsStruct>;

inline bool operator==(const tag_ContactReg& left, const tag_ContactReg& right)
{
    return std::memcmp(&left, &right, sizeof(left)) == 0;
}

inline std::string BytesOf(const Records& vRecords)
{
    return {reinterpret_cast<const char*>(vRecords.data()),
            vRecords.size() * sizeof(tag_ContactsStruct)};
}

inline std::string RecordsFile()
{
    return CDataDirectory::ReadBytes(CDataPaths::ContactRecords());
}

// A file of another size gives what no build writes.
inline tag_ContactReg Reg()
{
    const std::string strBytes = CDataDirectory::ReadBytes(CDataPaths::ContactReg());
    tag_ContactReg reg = {-77, -77, -77};
    if (strBytes.size() == sizeof(reg))
    {
        std::memcpy(&reg, strBytes.data(), sizeof(reg));
    }
    return reg;
}

inline void SetReg(const tag_ContactReg& reg)
{
    CDataDirectory::WriteBytes(CDataPaths::ContactReg(),
                               {reinterpret_cast<const char*>(&reg), sizeof(reg)});
}

#endif
