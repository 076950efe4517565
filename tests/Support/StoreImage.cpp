#include "tests/Support/StoreImage.h"

#include "Common/DataPaths.h"
#include "Common/NameOrder.h"
#include "Common/Utf8.h"
#include "Core/LocalizerLogic.h"
#include "tests/Support/DataDirectory.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <sstream>
#include <stdexcept>

namespace fs = std::filesystem;

namespace
{

using Records = std::vector<tag_ContactsStruct>;

// A root of its own beside another one, whose database and pinyin table it uses.
class CSecondRoot
{
public:
    explicit CSecondRoot(const std::string& strRoot) : m_strFirst(strRoot)
    {
        std::string strTemplate = (fs::temp_directory_path() / "qv_fresh_XXXXXX").string();
        if (mkdtemp(strTemplate.data()) == nullptr)
        {
            throw std::runtime_error("no temporary directory: " + strTemplate);
        }
        m_strRoot = strTemplate;
        fs::create_directory(m_strRoot + "/files");
        fs::create_directory_symlink(strRoot + "/databases", m_strRoot + "/databases");
        fs::create_symlink(strRoot + "/files/pyfile.bin", m_strRoot + "/files/pyfile.bin");
        CDataPaths::SetRoot(m_strRoot.c_str());
    }
    ~CSecondRoot()
    {
        CDataPaths::SetRoot(m_strFirst.c_str());
        std::error_code error;
        fs::remove_all(m_strRoot, error);
    }
    CSecondRoot(const CSecondRoot&) = delete;
    CSecondRoot& operator=(const CSecondRoot&) = delete;

private:
    std::string m_strFirst;
    std::string m_strRoot;
};

void Build(CLocalizerLogic& logic)
{
    if (logic.MemInit(true) != 0)
    {
        throw std::runtime_error("the fresh build failed");
    }
}

// Whether a has to stand behind b.
bool SortsBehind(const tag_ContactsStruct& a, const tag_ContactsStruct& b, int iSortType)
{
    return iSortType == STORE_ORDER_TIME ? a.llLastTimeContacted < b.llLastTimeContacted
                                         : NameSortsBehind(a, b);
}

// The end of the run of records with the sort keys of record uFirst.
size_t RunEnd(const Records& vRecords, size_t uFirst, int iSortType)
{
    size_t uEnd = uFirst + 1;
    while (uEnd < vRecords.size() && !SortsBehind(vRecords[uEnd], vRecords[uFirst], iSortType))
    {
        ++uEnd;
    }
    return uEnd;
}

// The records uFirst to uEnd - 1 by their ids and without their places.
Records Comparable(const Records& vRecords, size_t uFirst, size_t uEnd)
{
    Records vRun(vRecords.begin() + static_cast<std::ptrdiff_t>(uFirst),
                 vRecords.begin() + static_cast<std::ptrdiff_t>(uEnd));
    for (tag_ContactsStruct& record : vRun)
    {
        record.iSortIndex = 0;
    }
    std::sort(vRun.begin(), vRun.end(),
              [](const auto& a, const auto& b) { return a.iContactID < b.iContactID; });
    return vRun;
}

// The first byte that differs, the record's size when none does.
size_t FirstDifference(const tag_ContactsStruct& a, const tag_ContactsStruct& b)
{
    const char* pA = reinterpret_cast<const char*>(&a);
    return static_cast<size_t>(
        std::mismatch(pA, pA + sizeof(a), reinterpret_cast<const char*>(&b)).first - pA);
}

std::string RunDifference(const Records& vStore, const Records& vFresh, size_t uFirst)
{
    std::ostringstream text;
    for (size_t i = 0; i < vFresh.size(); ++i)
    {
        if (vStore[i].iContactID != vFresh[i].iContactID)
        {
            text << "slots from " << uFirst << ": contact " << vStore[i].iContactID
                 << " instead of " << vFresh[i].iContactID;
            return text.str();
        }
        const size_t uByte = FirstDifference(vStore[i], vFresh[i]);
        if (uByte < sizeof(tag_ContactsStruct))
        {
            text << "contact " << vStore[i].iContactID << " differs from byte " << uByte;
            return text.str();
        }
    }
    return {};
}

std::string PlaceDifference(const tag_StoreImage& store)
{
    for (size_t i = 0; i < store.vRecords.size(); ++i)
    {
        if (store.vRecords[i].iSortIndex != static_cast<int32_t>(i))
        {
            return "slot " + std::to_string(i) + " has iSortIndex " +
                   std::to_string(store.vRecords[i].iSortIndex);
        }
    }
    return {};
}

} // namespace

tag_StoreImage ReadStore()
{
    const std::string strReg = CDataDirectory::ReadBytes(CDataPaths::ContactReg());
    const std::string strRecords = CDataDirectory::ReadBytes(CDataPaths::ContactRecords());
    tag_StoreImage image;
    if (strReg.size() != sizeof(image.reg))
    {
        throw std::runtime_error("ContactsReg.bin is no registration record");
    }
    std::memcpy(&image.reg, strReg.data(), sizeof(image.reg));
    const size_t uBytes = static_cast<size_t>(image.reg.iTotalNum) * sizeof(tag_ContactsStruct);
    if (image.reg.iTotalNum < 0 || uBytes > strRecords.size())
    {
        throw std::runtime_error("ContactsLocalizer.bin is too short for its records");
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
    const CSecondRoot root(strRoot);
    CLocalizerLogic logic;
    Build(logic);
    if (iSortType != STORE_ORDER_NAME)
    {
        logic.SetSortType(iSortType);
        Build(logic);
    }
    return ReadStore();
}

std::string DifferenceOf(const tag_StoreImage& store, const tag_StoreImage& fresh)
{
    if (store.reg.iTotalNum != fresh.reg.iTotalNum || store.reg.iSortType != fresh.reg.iSortType)
    {
        std::ostringstream text;
        text << store.reg.iTotalNum << " contacts in order " << store.reg.iSortType
             << " instead of " << fresh.reg.iTotalNum << " in order " << fresh.reg.iSortType;
        return text.str();
    }
    const int iSortType = fresh.reg.iSortType;
    std::string strDifference;
    for (size_t i = 0; i < fresh.vRecords.size() && strDifference.empty();)
    {
        const size_t uEnd = RunEnd(fresh.vRecords, i, iSortType);
        strDifference = RunDifference(Comparable(store.vRecords, i, uEnd),
                                      Comparable(fresh.vRecords, i, uEnd), i);
        i = uEnd;
    }
    return strDifference.empty() && iSortType == STORE_ORDER_NAME ? PlaceDifference(store)
                                                                  : strDifference;
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
