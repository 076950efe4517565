#include "tests/stress/StoreFaults.h"

#include "tests/stress/Process.h"

#include <cstring>
#include <set>

namespace
{

bool IsBuiltRecord(const tag_ContactsStruct& record)
{
    static const tag_ContactsStruct empty = {};
    return record.iContactID > 0 && record.iPadding == 0 && record.szName[0] != 0 &&
           record.szName[CONTACT_MAX_NAME] == 0 && record.szLocalizerKey[CONTACT_MAX_KEY] == 0 &&
           std::memcmp(record.szReserved, empty.szReserved, sizeof(empty.szReserved)) == 0;
}

} // namespace

std::string FaultOf(const tag_StoreImage& image)
{
    std::set<int32_t> setIds;
    for (size_t i = 0; i < image.vRecords.size(); ++i)
    {
        const tag_ContactsStruct& record = image.vRecords[i];
        const std::string strSlot = " in slot " + std::to_string(i);
        if (!IsBuiltRecord(record))
        {
            return "a torn record" + strSlot;
        }
        if (!setIds.insert(record.iContactID).second)
        {
            return "contact " + std::to_string(record.iContactID) + " again" + strSlot;
        }
    }
    return IsMarked(image.reg) ? std::string() : OrderFaultOf(image);
}

void RequireFreshStore(const std::string& strRoot, const std::string& strText)
{
    const tag_StoreImage store = ReadStore();
    Require(!IsMarked(store.reg), strText + ": still asking for a rebuild");
    const std::string strDifference = DifferenceOf(store, FreshBuild(strRoot, store.reg.iSortType));
    Require(strDifference.empty(), strText + ": not a fresh build: " + strDifference);
}
