#include "tests/Support/StoreImage.h"

#include "Common/DataPaths.h"
#include "Common/NameOrder.h"
#include "Common/Utf8.h"
#include "Core/LocalizerLogic.h"
#include "tests/Support/StoreFiles.h"

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <stdexcept>

namespace fs = std::filesystem;

namespace
{

void Build(CLocalizerLogic& logic)
{
    if (logic.MemInit(true) != 0)
    {
        throw std::runtime_error("the fresh build failed");
    }
}

Records ById(Records vRecords)
{
    std::sort(vRecords.begin(), vRecords.end(),
              [](const auto& a, const auto& b) { return a.iContactID < b.iContactID; });
    return vRecords;
}

// The first record that differs in more than its place.
std::string RecordDifference(const Records& vStore, const Records& vFresh)
{
    for (size_t i = 0; i < vFresh.size(); ++i)
    {
        tag_ContactsStruct record = vStore[i];
        record.iSortIndex = vFresh[i].iSortIndex;
        const char* pBytes = reinterpret_cast<const char*>(&record);
        const char* pFresh = reinterpret_cast<const char*>(&vFresh[i]);
        const std::ptrdiff_t iByte =
            std::mismatch(pBytes, pBytes + sizeof(record), pFresh).first - pBytes;
        if (iByte < static_cast<std::ptrdiff_t>(sizeof(record)))
        {
            return "contact " + std::to_string(record.iContactID) + " differs from contact " +
                   std::to_string(vFresh[i].iContactID) + " from byte " + std::to_string(iByte);
        }
    }
    return {};
}

bool IsInPlace(const Records& vRecords, size_t uSlot, int iSortType)
{
    const tag_ContactsStruct& record = vRecords[uSlot];
    if (iSortType == STORE_ORDER_TIME)
    {
        return uSlot == 0 || vRecords[uSlot - 1].llLastTimeContacted >= record.llLastTimeContacted;
    }
    return record.iSortIndex == static_cast<int32_t>(uSlot) &&
           (uSlot == 0 || !NameSortsBehind(vRecords[uSlot - 1], record));
}

} // namespace

tag_StoreImage ReadStore()
{
    const std::string strRecords = RecordsFile();
    tag_StoreImage image = {Reg(), {}};
    const size_t uBytes = static_cast<size_t>(image.reg.iTotalNum) * sizeof(tag_ContactsStruct);
    if (image.reg.iTotalNum < 0 || uBytes > strRecords.size())
    {
        throw std::runtime_error("the store's files do not fit together");
    }
    image.vRecords.resize(static_cast<size_t>(image.reg.iTotalNum));
    if (uBytes > 0)
    {
        std::memcpy(static_cast<void*>(image.vRecords.data()), strRecords.data(), uBytes);
    }
    return image;
}

tag_StoreImage FreshBuild(const std::string& strRoot, int iSortType)
{
    tag_StoreImage image;
    {
        const CDataDirectory beside;
        fs::remove(beside.Root() + "/databases");
        fs::create_directory_symlink(strRoot + "/databases", beside.Root() + "/databases");
        fs::create_symlink(strRoot + "/files/pyfile.bin", CDataPaths::PinyinSource());
        CLocalizerLogic logic;
        Build(logic);
        if (iSortType != STORE_ORDER_NAME)
        {
            logic.SetSortType(iSortType);
            Build(logic);
        }
        image = ReadStore();
    }
    CDataPaths::SetRoot(strRoot.c_str());
    return image;
}

std::string DifferenceOf(const tag_StoreImage& store, const tag_StoreImage& fresh)
{
    if (store.reg.iTotalNum != fresh.reg.iTotalNum || store.reg.iSortType != fresh.reg.iSortType)
    {
        return std::to_string(store.reg.iTotalNum) + " contacts in order " +
               std::to_string(store.reg.iSortType) + " instead of " +
               std::to_string(fresh.reg.iTotalNum) + " in order " +
               std::to_string(fresh.reg.iSortType);
    }
    const std::string strDifference = RecordDifference(ById(store.vRecords), ById(fresh.vRecords));
    return strDifference.empty() ? OrderFaultOf(store) : strDifference;
}

std::string OrderFaultOf(const tag_StoreImage& image)
{
    for (size_t i = 0; i < image.vRecords.size(); ++i)
    {
        if (!IsInPlace(image.vRecords, i, image.reg.iSortType))
        {
            return "a wrong order in slot " + std::to_string(i);
        }
    }
    return {};
}

std::string LocalizerKeyOf(const std::string& strName)
{
    wchar_t szName[CONTACT_MAX_NAME + 1] = {};
    Utf82Unicode(strName.c_str(), szName,
                 std::min(static_cast<int>(strName.size()), CONTACT_MAX_NAME) - 1);
    wchar_t szKey[CONTACT_MAX_KEY + 1] = {};
    if (CLocalizerLogic().GetLocalizer(szName, szKey) != 0)
    {
        throw std::runtime_error("no key for the name " + strName);
    }
    char szUtf8[CONTACT_MAX_KEY * 3 + 1] = {};
    Unicode2Utf8(szKey, szUtf8, CONTACT_MAX_KEY - 1);
    return szUtf8;
}
