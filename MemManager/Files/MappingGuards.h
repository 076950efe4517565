#ifndef QV_MEMMANAGER_FILES_MAPPINGGUARDS_H
#define QV_MEMMANAGER_FILES_MAPPINGGUARDS_H

// Scope guards of mappings and of the store lock: a guard closes or releases what it holds when it
// goes out of scope.

#include "MemManager/Files/ShareMemory.h"

#include <sys/mman.h>

// A private read-only mapping.
class CReadMapping
{
public:
    CReadMapping() = default;
    CReadMapping(const char* szPath, size_t uSize) { Open(szPath, uSize); }
    ~CReadMapping() { Close(); }
    CReadMapping(const CReadMapping&) = delete;
    CReadMapping& operator=(const CReadMapping&) = delete;

    // Closes what is open and maps the first uSize bytes of the file; false when that failed.
    bool Open(const char* szPath, size_t uSize)
    {
        Close();
        void* pAddr = OpenReadShareMemory(szPath, uSize);
        m_pAddr = pAddr == MAP_FAILED ? nullptr : pAddr;
        m_uSize = uSize;
        return IsOpen();
    }
    void Close()
    {
        CloseReadShareMemory(m_pAddr, m_uSize);
        m_pAddr = nullptr;
    }
    bool IsOpen() const { return m_pAddr != nullptr; }
    // The mapped bytes as records of type T; null when nothing is mapped.
    template <typename T>
    const T* As() const
    {
        return static_cast<const T*>(m_pAddr);
    }

private:
    void* m_pAddr = nullptr;
    size_t m_uSize = 0;
};

// A shared read-write mapping.
class CWriteMapping
{
public:
    CWriteMapping() = default;
    CWriteMapping(const char* szPath, size_t uSize) { Open(szPath, uSize); }
    ~CWriteMapping() { Close(); }
    CWriteMapping(const CWriteMapping&) = delete;
    CWriteMapping& operator=(const CWriteMapping&) = delete;

    // Closes what is open and maps the first uSize bytes of the file, which is created and
    // extended as needed; false when that failed.
    bool Open(const char* szPath, size_t uSize)
    {
        Close();
        void* pAddr = OpenWriteShareMemory(szPath, uSize);
        m_pAddr = pAddr == MAP_FAILED ? nullptr : pAddr;
        m_uSize = uSize;
        return IsOpen();
    }
    // Flushes what was written to the disk; false when that failed.
    bool Flush() const { return msync(m_pAddr, m_uSize, MS_SYNC) == 0; }
    // Flushes and unmaps; bSync other than 0 waits for the disk.
    void Close(int bSync = 0)
    {
        CloseWriteShareMemory(m_pAddr, m_uSize, bSync);
        m_pAddr = nullptr;
    }
    bool IsOpen() const { return m_pAddr != nullptr; }
    template <typename T>
    T* As() const
    {
        return static_cast<T*>(m_pAddr);
    }
    // Hands the mapping over: the caller closes it, with the size it was opened with.
    template <typename T>
    T* Detach()
    {
        T* pAddr = As<T>();
        m_pAddr = nullptr;
        return pAddr;
    }

private:
    void* m_pAddr = nullptr;
    size_t m_uSize = 0;
};

#endif
