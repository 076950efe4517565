#ifndef QV_TESTS_MEMMANAGER_STOREFIXTURE_H
#define QV_TESTS_MEMMANAGER_STOREFIXTURE_H

#include "MemManager/MemManger.h"
#include "MemManager/StoreRegister.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/StoreFiles.h"

#include <algorithm>
#include <cstring>
#include <gtest/gtest.h>
#include <string>
#include <vector>

// A store manager in a data directory of its own.
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

    CDataDirectory m_directory;
    CLogCapture m_log;
    CMemManger m_store;
};

#endif
