#ifndef QV_TESTS_SUPPORT_STOREIMAGE_H
#define QV_TESTS_SUPPORT_STOREIMAGE_H

// The store of the library's present root, as bytes and as records.

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

// Whether the capacity asks for a rebuild.
inline bool IsMarked(const tag_ContactReg& reg)
{
    return reg.iTotalNum > reg.iMemSize || reg.iMemSize == 0;
}

template <typename Item = tag_ContactsStruct>
std::string BytesOf(const std::vector<Item>& vItems)
{
    return {reinterpret_cast<const char*>(vItems.data()), vItems.size() * sizeof(Item)};
}

// The two files of a store.
struct tag_StoreFiles
{
    std::string strReg{};
    std::string strRecords{};
};

inline tag_StoreFiles ReadFiles()
{
    return {CDataDirectory::ReadBytes(CDataPaths::ContactReg()),
            CDataDirectory::ReadBytes(CDataPaths::ContactRecords())};
}

inline void SetReg(const tag_ContactReg& reg)
{
    CDataDirectory::WriteBytes(CDataPaths::ContactReg(),
                               {reinterpret_cast<const char*>(&reg), sizeof(reg)});
}

// What a store's two files say: the registration record and the records that it counts. A
// registration record of another size is read as zeros, a records file that is too short to its
// end.
struct tag_StoreImage
{
    tag_StoreImage() = default;
    explicit tag_StoreImage(const tag_StoreFiles& files)
    {
        if (files.strReg.size() == sizeof(reg))
        {
            std::memcpy(&reg, files.strReg.data(), sizeof(reg));
        }
        const auto uCounted = static_cast<size_t>(std::max(reg.iTotalNum, 0));
        vRecords.resize(std::min(uCounted, files.strRecords.size() / sizeof(tag_ContactsStruct)));
        std::copy_n(files.strRecords.data(), vRecords.size() * sizeof(tag_ContactsStruct),
                    reinterpret_cast<char*>(vRecords.data()));
    }

    tag_ContactReg reg{};
    Records vRecords{};
};

inline tag_StoreImage ReadStore()
{
    return tag_StoreImage(ReadFiles());
}

inline tag_ContactReg Reg()
{
    return ReadStore().reg;
}

// The store that a build makes from the database of strRoot in the order of iSortType, with the
// pinyin table of strRoot. It is built in a directory of its own, after which strRoot is the
// library's root.
tag_StoreImage FreshBuild(const std::string& strRoot, int iSortType);

// What makes the store another one than the fresh build, empty when nothing does: the counts and
// sort type, the bytes of every record but its iSortIndex and all but the given flags, the order
// and in name order iSortIndex. The capacity is not compared, nor the order of records with equal
// sort keys.
std::string DifferenceOf(const tag_StoreImage& store, const tag_StoreImage& fresh,
                         uint32_t uFlags = ~0U);

// The localizer codes of a display name, as the provider stores them; both in UTF-8. The pinyin
// mapping has to be there.
std::string LocalizerKeyOf(const std::string& strName);

#endif
