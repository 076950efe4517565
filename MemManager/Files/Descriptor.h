#ifndef QV_MEMMANAGER_FILES_DESCRIPTOR_H
#define QV_MEMMANAGER_FILES_DESCRIPTOR_H

#include <cerrno>
#include <sys/types.h>
#include <unistd.h>

// Owns an open file descriptor and closes it at the end of its scope, without changing errno.
class CDescriptor
{
public:
    explicit CDescriptor(int iFd = NONE) : m_iFd(iFd) {}
    ~CDescriptor() { Reset(); }
    CDescriptor(const CDescriptor&) = delete;
    CDescriptor& operator=(const CDescriptor&) = delete;

    bool IsOpen() const { return m_iFd >= 0; }
    int Get() const { return m_iFd; }
    // Closes what is open and owns iFd instead.
    void Reset(int iFd = NONE)
    {
        if (IsOpen())
        {
            const int iError = errno;
            close(m_iFd);
            errno = iError;
        }
        m_iFd = iFd;
    }
    // Hands the descriptor over: the caller closes it.
    int Detach()
    {
        const int iFd = m_iFd;
        m_iFd = NONE;
        return iFd;
    }

private:
    static constexpr int NONE = -1;

    int m_iFd; // negative when nothing is open
};

// Opens a file of the store with the flags of open(2) and, for a file that is created, the
// permission bits. The call never waits, and programs that the process starts do not inherit the
// descriptor. Returns -1 with errno on failure; EINVAL for anything that is not a regular file,
// since a pipe in its place would block a reader that holds the lock.
int OpenStoreFile(const char* szPath, int iFlags, mode_t uMode = 0);

#endif
