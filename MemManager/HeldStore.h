#ifndef QV_MEMMANAGER_HELDSTORE_H
#define QV_MEMMANAGER_HELDSTORE_H

// The store as the change handlers hold it: the store lock, then the writer lock, then the write
// mappings. They wait for the store lock without limit as long as somebody else holds it, and give
// up after five attempts if its file cannot be opened. If a change cannot be made, the store is
// marked, so that the next notification of contacts or status makes up for it.

#include "MemManager/Files/MappingGuards.h"
#include "MemManager/Files/StoreLock.h"
#include "MemManager/StoreRegister.h"

class CMemManger;

enum HOLD_RESULT
{
    HOLD_READY,
    HOLD_NOTHING, // there is no store, or it cannot be changed now and was marked
    HOLD_REBUILD  // the caller has to release the lock and rebuild the store
};

// Marks the store for a change that did not reach it. Tries the lock like a build; without it a
// running writer may lift the mark, so the process remembers the change as well.
void MarkForLostChange();

// Whether the store is whole and no change was lost. Waits for a change that is under way, until it
// is on the disk, as long as a build would.
bool IsStoreWhole();

// The store during a patch: the manager owns the store lock and the mappings.
class CHeldStore
{
public:
    explicit CHeldStore(CMemManger& manager);
    ~CHeldStore() { Release(); }
    CHeldStore(const CHeldStore&) = delete;
    CHeldStore& operator=(const CHeldStore&) = delete;

    // Maps both files; a missing store is not created.
    HOLD_RESULT Open();
    // Releases the mappings and the store lock; the writer lock stays.
    void Release();

    // What HOLD_READY gives.
    tag_ContactsStruct* Records() const { return m_pRecords; }
    tag_ContactReg& Reg() const { return *m_pReg; }
    int MappedSlots() const { return m_iMappedSlots; }

private:
    CMemManger& m_manager;
    CWriterLock m_writer;
    bool m_bLocked;
    tag_ContactsStruct* m_pRecords = nullptr;
    tag_ContactReg* m_pReg = nullptr;
    int m_iMappedSlots = 0;
};

// The stored records while one of them changes: owns its lock and a mapping of the used slots.
class CHeldRecords
{
public:
    explicit CHeldRecords(const char* szRefused);

    // The first slot of the contact; -1 when it is not stored or the store cannot be changed.
    int Find(long iContactID);
    // What Find found.
    tag_ContactsStruct* Records() const { return m_records.As<tag_ContactsStruct>(); }
    const tag_ContactReg& Reg() const { return m_reg; }
    // Releases the mapping and the store lock; the writer lock stays.
    void Release();

private:
    bool Open();

    CWriterLock m_writer;
    CStoreLock m_lock; // released after the mapping
    bool m_bLocked;
    tag_ContactReg m_reg = {};
    CWriteMapping m_records;
};

#endif
