#ifndef QV_TESTS_FAULTS_STORESTEPPER_H
#define QV_TESTS_FAULTS_STORESTEPPER_H

#include "tests/faults/CallFaults.h"

#include <cstdint>
#include <string>

enum STEP_KIND : uint8_t
{
    STEP_STORE,  // one instruction changed uBytes of a mapped file
    STEP_LENGTH, // a file was mapped; uOffset is its length
    STEP_FLUSH   // a file was flushed to the disk
};

// What happened to a mapped file.
struct tag_Step
{
    static constexpr size_t MAX_BYTES = 64; // the widest store

    STEP_KIND eKind;
    bool bReg; // of the registration record, else of the records
    uint8_t uBytes;
    uint32_t uOffset;
    char acBytes[MAX_BYTES];
};

struct tag_Steps
{
    static constexpr uint32_t MAX_STEPS = 100'000;

    uint32_t uSteps;
    tag_Step aSteps[MAX_STEPS];
};

// Steps over each store to the store files' shared mappings while it is watching: they are
// read-only, and the instruction that is refused runs alone with its pages writable. And sees that
// the store lock is held around each mapping of records, and the writer lock alone while they are
// flushed.
class CStoreStepper : public CMapWatch
{
public:
    // Where steps cannot be taken, only the mappings are looked at.
    static bool IsPossible();

    explicit CStoreStepper(tag_Steps& steps);
    ~CStoreStepper();
    CStoreStepper(const CStoreStepper&) = delete;
    CStoreStepper& operator=(const CStoreStepper&) = delete;

    const std::string& Fault() const { return m_strFault; }

    void Happens(MAP_EVENT eEvent, const tag_Mapping& mapping) override;

private:
    void ExamineLocks(bool bFlushes);

    std::string m_strFault{};
};

#endif
