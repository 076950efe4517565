#include "MemManager/StoreCheck.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "MemManager/MappingGuards.h"

#include <algorithm>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace
{

bool IsCount(int32_t iCount)
{
    return iCount >= 0 && iCount <= STORE_MAX_RECORDS;
}

// Bytes of the records file, 0 when there is none.
int64_t RecordsFileSize()
{
    struct stat info = {};
    if (stat(CDataPaths::ContactRecords(), &info) != 0 || !S_ISREG(info.st_mode))
    {
        return 0;
    }
    return info.st_size;
}

// Tests a record beside the records file as it is now and tells of damage. Records files never
// get shorter, so a record read before a writer extended its file passes all the same.
bool IsFoundDamaged(const tag_ContactReg& reg)
{
    const int64_t llFileSize = RecordsFileSize();
    if (!CStoreCheck::IsDamaged(reg, llFileSize))
    {
        return false;
    }
    QV_LOGE(QV_LOG_TAG,
            "QV_Contacts: damaged registration record: iTotalNum = %d, iMemSize = %d, "
            "records file = %lld bytes\n",
            reg.iTotalNum, reg.iMemSize, static_cast<long long>(llFileSize));
    return true;
}

// Bytes of the registration file that were read, up to a whole record.
size_t ReadRegBytes(tag_ContactReg* pReg)
{
    *pReg = {};
    const int iFd = open(CDataPaths::ContactReg(), O_RDONLY | O_CLOEXEC);
    if (iFd < 0)
    {
        return 0;
    }
    const ssize_t iRead = read(iFd, pReg, sizeof(*pReg));
    close(iFd);
    return iRead < 0 ? 0 : static_cast<size_t>(iRead);
}

} // namespace

bool CStoreCheck::IsDamaged(const tag_ContactReg& reg, int64_t llFileSize)
{
    if (!IsCount(reg.iTotalNum) || !IsCount(reg.iMemSize))
    {
        return true;
    }
    const int64_t llSpare = int64_t{STORE_SPARE_RECORDS} * STORE_RECORD_SIZE;
    return int64_t{reg.iTotalNum} * STORE_RECORD_SIZE > llFileSize ||
           int64_t{reg.iMemSize} * STORE_RECORD_SIZE > std::max(llFileSize, llSpare);
}

STORE_STATE CStoreCheck::ReadReg(tag_ContactReg* pReg)
{
    const size_t uRead = ReadRegBytes(pReg);
    if (IsFoundDamaged(*pReg))
    {
        return STORE_DAMAGED;
    }
    return uRead == sizeof(*pReg) ? STORE_GOOD : STORE_MISSING;
}

bool CStoreCheck::IsStoreDamaged()
{
    tag_ContactReg reg = {};
    return ReadReg(&reg) == STORE_DAMAGED;
}

int CStoreCheck::MapReg(tag_ContactReg* pReg)
{
    CReadMapping mapping(CDataPaths::ContactReg(), sizeof(*pReg));
    if (!mapping.IsOpen())
    {
        return -1;
    }
    const tag_ContactReg reg = *mapping.As<tag_ContactReg>();
    mapping.Close();
    if (IsFoundDamaged(reg))
    {
        return -1;
    }
    *pReg = reg;
    return 0;
}
