#ifndef QV_TESTS_MEMMANAGER_STOREFIXTURE_H
#define QV_TESTS_MEMMANAGER_STOREFIXTURE_H

#include "Common/DataPaths.h"
#include "MemManager/MemManger.h"
#include "MemManager/StoreCheck.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"

#include <algorithm>
#include <cstring>
#include <gtest/gtest.h>
#include <string>
#include <vector>

constexpr int ERROR_LINE = 6;

using Lines = std::vector<std::string>;
using Records = std::vector<tag_ContactsStruct>;

inline bool operator==(const tag_ContactReg& left, const tag_ContactReg& right)
{
    return std::memcmp(&left, &right, sizeof(left)) == 0;
}

// A store manager in a data directory of its own, and the store's files as bytes.
class StoreFixture : public testing::Test
{
protected:
    // iNum records that differ in every field that is copied anywhere.
    static Records MakeRecords(int iNum, int iFirstID = 1)
    {
        Records vRecords(static_cast<size_t>(iNum));
        for (int i = 0; i < iNum; ++i)
        {
            tag_ContactsStruct& record = vRecords[static_cast<size_t>(i)];
            record.iContactID = iFirstID + i;
            record.iSortIndex = i;
            record.llLastTimeContacted = 5'000'000'000LL + i;
            record.szName[0] = static_cast<wchar_t>('a' + i % 26);
            std::fill_n(record.szLocalizerKey, i % (CONTACT_MAX_KEY + 1), 0x1000 + i);
        }
        return vRecords;
    }

    int Build(Records vRecords)
    {
        tag_ContactsInfo info = {static_cast<int32_t>(vRecords.size()), vRecords.data()};
        return m_store.InitContactRecord(&info);
    }

    static std::string Bytes(const Records& vRecords)
    {
        return {reinterpret_cast<const char*>(vRecords.data()),
                vRecords.size() * sizeof(tag_ContactsStruct)};
    }
    static std::string RecordsFile()
    {
        return CDataDirectory::ReadBytes(CDataPaths::ContactRecords());
    }
    static tag_ContactReg Reg()
    {
        const std::string strBytes = CDataDirectory::ReadBytes(CDataPaths::ContactReg());
        tag_ContactReg reg = {-77, -77, -77};
        EXPECT_EQ(strBytes.size(), sizeof(reg));
        std::memcpy(&reg, strBytes.data(), std::min(sizeof(reg), strBytes.size()));
        return reg;
    }
    static void SetReg(const tag_ContactReg& reg)
    {
        CDataDirectory::WriteBytes(CDataPaths::ContactReg(),
                                   {reinterpret_cast<const char*>(&reg), sizeof(reg)});
    }

    CDataDirectory m_directory;
    CLogCapture m_log;
    CMemManger m_store;
};

#endif
