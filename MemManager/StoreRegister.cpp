#include "MemManager/StoreRegister.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "MemManager/Files/Descriptor.h"
#include "MemManager/Files/MappingGuards.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

namespace
{

constexpr int64_t SIZE_UNKNOWN = -1;

std::atomic<bool> g_bChangeLost(false);

bool IsCount(int32_t iCount)
{
    return iCount >= 0 && iCount <= STORE_MAX_RECORDS;
}

// Bytes of a regular file, 0 if it is missing, SIZE_UNKNOWN for anything else.
int64_t FileSize(const char* szPath)
{
    struct stat info = {};
    if (stat(szPath, &info) != 0)
    {
        return errno == ENOENT ? 0 : SIZE_UNKNOWN;
    }
    return S_ISREG(info.st_mode) ? info.st_size : SIZE_UNKNOWN;
}

STORE_STATE Classify(const tag_ContactReg& reg)
{
    // Records files never get shorter, so a record that was read before a writer extended the file
    // is still valid.
    const int64_t llFileSize = FileSize(CDataPaths::ContactRecords());
    if (llFileSize == SIZE_UNKNOWN)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: %s is no file or cannot be examined\n",
                CDataPaths::ContactRecords());
        return STORE_UNREADABLE;
    }
    if (CStoreRegister::IsDamaged(reg, llFileSize))
    {
        QV_LOGE(QV_LOG_TAG,
                "QV_Contacts: damaged registration record: iTotalNum = %d, iMemSize = %d, "
                "records file = %lld bytes\n",
                reg.iTotalNum, reg.iMemSize, static_cast<long long>(llFileSize));
        return STORE_DAMAGED;
    }
    return reg.iMemSize == 0 || reg.iMemSize < reg.iTotalNum ? STORE_MARKED : STORE_WHOLE;
}

// Why the record could not be mapped. No writer leaves a file that ends within it.
STORE_STATE StateWithoutRecord()
{
    const int64_t llSize = FileSize(CDataPaths::ContactReg());
    if (llSize == 0)
    {
        return STORE_MISSING;
    }
    return llSize > 0 && llSize < static_cast<int64_t>(sizeof(tag_ContactReg)) ? STORE_DAMAGED
                                                                               : STORE_UNREADABLE;
}

// Fields of a mapped record, which other processes may read and, without the lock, write: each
// access happens once, in the order of the program.
int32_t Load(const int32_t& iField)
{
    return __atomic_load_n(&iField, __ATOMIC_SEQ_CST);
}

void Store(int32_t& iField, int32_t iValue)
{
    __atomic_store_n(&iField, iValue, __ATOMIC_SEQ_CST);
}

// Reads the capacity last: if the sort type changes meanwhile, the capacity is 0 by then.
tag_ContactReg Copy(const tag_ContactReg& mapped)
{
    tag_ContactReg reg = {};
    reg.iTotalNum = Load(mapped.iTotalNum);
    reg.iSortType = Load(mapped.iSortType);
    reg.iMemSize = Load(mapped.iMemSize);
    return reg;
}

int Flush(tag_ContactReg& reg)
{
    return msync(&reg, sizeof(reg), MS_SYNC);
}

// Flushes the records to the disk; false if that may have failed. A store that was always empty has
// no file.
bool FlushRecords()
{
    const CDescriptor file(OpenStoreFile(CDataPaths::ContactRecords(), O_RDWR));
    return file.IsOpen() ? fdatasync(file.Get()) == 0 : errno == ENOENT;
}

// Restores the capacity unless the stored sort type is not, or no longer, iSortedBy.
LIFT_RESULT SetCapacity(tag_ContactReg& reg, int iCapacity, int iSortedBy)
{
    if (Load(reg.iSortType) != iSortedBy)
    {
        return LIFT_OUT_OF_ORDER;
    }
    Store(reg.iMemSize, iCapacity);
    if (Load(reg.iSortType) == iSortedBy)
    {
        return LIFT_DONE;
    }
    Store(reg.iMemSize, 0);
    return LIFT_OUT_OF_ORDER;
}

} // namespace

bool CStoreRegister::IsDamaged(const tag_ContactReg& reg, int64_t llFileSize)
{
    if (!IsCount(reg.iTotalNum) || !IsCount(reg.iMemSize))
    {
        return true;
    }
    const int64_t llSpare = int64_t{STORE_SPARE_RECORDS} * STORE_RECORD_SIZE;
    return int64_t{reg.iTotalNum} * STORE_RECORD_SIZE > llFileSize ||
           int64_t{reg.iMemSize} * STORE_RECORD_SIZE > std::max(llFileSize, llSpare);
}

STORE_STATE CStoreRegister::Read(tag_ContactReg* pReg)
{
    *pReg = {};
    CReadMapping mapping(CDataPaths::ContactReg(), sizeof(*pReg));
    if (!mapping.IsOpen())
    {
        return StateWithoutRecord();
    }
    const tag_ContactReg reg = Copy(*mapping.As<tag_ContactReg>());
    mapping.Close();
    const STORE_STATE eState = Classify(reg);
    if (HasRecord(eState))
    {
        *pReg = reg;
    }
    return eState;
}

STORE_STATE CStoreRegister::Inspect(tag_ContactReg* pReg)
{
    *pReg = {};
    return FileSize(CDataPaths::ContactReg()) == 0 ? STORE_MISSING : Read(pReg);
}

bool CStoreRegister::HasRecord(STORE_STATE eState)
{
    return eState == STORE_MARKED || eState == STORE_WHOLE;
}

int CStoreRegister::MarkFile()
{
    if (FileSize(CDataPaths::ContactReg()) == 0)
    {
        return 0;
    }
    const CWriteMapping mapping(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    return mapping.IsOpen() ? CStoreRegister(*mapping.As<tag_ContactReg>()).Mark() : -1;
}

void CStoreRegister::StoreSortType(int iSortType)
{
    tag_ContactReg regOld = {};
    if (!HasRecord(Inspect(&regOld)))
    {
        return;
    }
    CWriteMapping mapping(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    if (!mapping.IsOpen())
    {
        return;
    }
    // The mark is set before the sort type, in case this process dies here, and after it, in case a
    // writer lifted the mark before it could see the new sort type.
    auto& reg = *mapping.As<tag_ContactReg>();
    Store(reg.iMemSize, 0);
    Store(reg.iSortType, iSortType);
    Store(reg.iMemSize, 0);
    mapping.Close(1);
}

bool CStoreRegister::IsChangeLost()
{
    return g_bChangeLost;
}

void CStoreRegister::SetChangeLost(bool bLost)
{
    g_bChangeLost = bLost;
}

CStoreRegister::CStoreRegister(tag_ContactReg& reg)
    : m_reg(reg), m_iSortType(Copy(reg).iSortType), m_iCapacity(Copy(reg).iMemSize)
{
}

int CStoreRegister::Mark()
{
    Store(m_reg.iMemSize, 0);
    return Flush(m_reg);
}

void CStoreRegister::SetCount(int iTotalNum)
{
    Store(m_reg.iTotalNum, iTotalNum);
}

LIFT_RESULT CStoreRegister::Lift(int iCapacity, int iSortedBy)
{
    // If the files were deleted meanwhile, mapping the record would create an empty whole store.
    if (iCapacity == 0 || FileSize(CDataPaths::ContactReg()) <= 0 || !FlushRecords())
    {
        return LIFT_FAILED;
    }
    const CWriteMapping mapping(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    return mapping.IsOpen() ? SetCapacity(*mapping.As<tag_ContactReg>(), iCapacity, iSortedBy)
                            : LIFT_FAILED;
}
