#ifndef QV_TESTS_SUPPORT_STOREIMAGE_H
#define QV_TESTS_SUPPORT_STOREIMAGE_H

#include "Core/Records/ContactRecords.h"

#include <string>
#include <vector>

// What a store's two files say: the registration record and the records that it counts.
struct tag_StoreImage
{
    tag_ContactReg reg{};
    std::vector<tag_ContactsStruct> vRecords{};
};

// The store of the library's present root; std::runtime_error when its files do not fit together.
tag_StoreImage ReadStore();

// The store that a build makes from the database of strRoot in the order of iSortType, with the
// pinyin table of strRoot. It is built in a directory of its own, after which strRoot is the
// library's root.
tag_StoreImage FreshBuild(const std::string& strRoot, int iSortType);

// What makes the store another one than the fresh build, empty when nothing does: the counts and
// sort type, the bytes of every record but its iSortIndex, the order. The capacity is not
// compared, nor the order of records with equal sort keys.
std::string DifferenceOf(const tag_StoreImage& store, const tag_StoreImage& fresh);

// The first record that is not in the order of the sort type or, in name order, has an iSortIndex
// that is not its slot; empty when there is none.
std::string OrderFaultOf(const tag_StoreImage& image);

// Whether the capacity asks for a rebuild.
inline bool IsMarked(const tag_ContactReg& reg)
{
    return reg.iTotalNum > reg.iMemSize || reg.iMemSize == 0;
}

// The localizer codes of a display name, as the provider stores them; both in UTF-8. The pinyin
// mapping has to be there.
std::string LocalizerKeyOf(const std::string& strName);

#endif
