#ifndef QV_TOOLS_INDEXWATCH_H
#define QV_TOOLS_INDEXWATCH_H

#include <array>
#include <cstdint>

// Notices that another process changed the index, without the store lock and without reading
// the records.
//
// Every change opens the files that it writes to, which writes their last byte and so updates the
// time of the file on every file system; writes through the mapping need not update it. A change
// does so with the store lock held, and releases it when records and count are written. A search
// waits for the lock. So a search that begins after Note either sees a change whose time Note saw,
// or the change comes later and updates the time again.
//
// Two changes within one step of the file system's clock leave the same time. Therefore a time
// that was still young at Note is not relied on: Changed then reports a change once it has aged.
class CIndexWatch
{
public:
    // Remembers the state of the files; called before the search that is to be kept.
    void Note();
    // Whether the index may have changed since Note.
    bool Changed() const;

private:
    struct tag_FileState
    {
        uint64_t uDevice;
        uint64_t uNumber;
        int64_t llSize;
        int64_t llTime; // nanoseconds
        bool operator==(const tag_FileState& other) const;
    };
    static constexpr int FILES = 2;
    using States = std::array<tag_FileState, FILES>;

    static tag_FileState StateOf(const char* szPath);
    static States ReadStates();
    static bool IsYoung(const States& states);

    States m_states = {};
    bool m_bYoung = false;
};

#endif
