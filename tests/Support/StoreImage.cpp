#include "tests/Support/StoreImage.h"

#include "Common/NameOrder.h"
#include "Core/LocalizerLogic.h"
#include "tools/Utf8Text.h"

#include <filesystem>
#include <stdexcept>

namespace fs = std::filesystem;

namespace
{

// By contact, without their places and with some of their flags.
Records ById(Records vRecords, uint32_t uFlags)
{
    for (tag_ContactsStruct& record : vRecords)
    {
        record.iSortIndex = 0;
        record.iFlags &= uFlags;
    }
    std::sort(vRecords.begin(), vRecords.end(),
              [](const auto& a, const auto& b) { return a.iContactID < b.iContactID; });
    return vRecords;
}

bool IsInPlace(const tag_StoreImage& store, size_t uSlot)
{
    const tag_ContactsStruct& record = store.vRecords[uSlot];
    const tag_ContactsStruct& before = store.vRecords[uSlot == 0 ? 0 : uSlot - 1];
    return store.reg.iSortType == STORE_ORDER_TIME
               ? before.llLastTimeContacted >= record.llLastTimeContacted
               : record.iSortIndex == static_cast<int32_t>(uSlot) &&
                     !NameSortsBehind(before, record);
}

std::string KindOf(const tag_StoreImage& store)
{
    return std::to_string(store.vRecords.size()) + " of " + std::to_string(store.reg.iTotalNum) +
           " contacts in order " + std::to_string(store.reg.iSortType);
}

} // namespace

tag_StoreImage FreshBuild(const std::string& strRoot, int iSortType)
{
    tag_StoreImage image;
    {
        const CDataDirectory beside;
        fs::remove(beside.Root() + "/databases");
        fs::create_directory_symlink(strRoot + "/databases", beside.Root() + "/databases");
        fs::create_symlink(strRoot + "/files/pyfile.bin", CDataPaths::PinyinSource());
        SetReg({0, iSortType, 0});
        if (CLocalizerLogic().MemInit(true) != 0)
        {
            throw std::runtime_error("the fresh build failed");
        }
        image = ReadStore();
    }
    CDataPaths::SetRoot(strRoot.c_str());
    return image;
}

std::string DifferenceOf(const tag_StoreImage& store, const tag_StoreImage& fresh, uint32_t uFlags)
{
    if (KindOf(store) != KindOf(fresh))
    {
        return KindOf(store) + " instead of " + KindOf(fresh);
    }
    const Records vStore = ById(store.vRecords, uFlags);
    const Records vFresh = ById(fresh.vRecords, uFlags);
    for (size_t i = 0; i < vFresh.size(); ++i)
    {
        if (BytesOf({vStore[i]}) != BytesOf({vFresh[i]}))
        {
            return "contact " + std::to_string(vStore[i].iContactID) + " differs";
        }
        if (!IsInPlace(store, i))
        {
            return "a wrong order in slot " + std::to_string(i);
        }
    }
    return {};
}

std::string LocalizerKeyOf(const std::string& strName)
{
    std::wstring strWide = WideText(strName).substr(0, CONTACT_MAX_NAME);
    wchar_t szKey[CONTACT_MAX_KEY + 1] = {};
    if (CLocalizerLogic().GetLocalizer(strWide.data(), szKey) != 0)
    {
        throw std::runtime_error("no key for the name " + strName);
    }
    return Utf8Text(szKey);
}
