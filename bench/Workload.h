#ifndef QV_BENCH_WORKLOAD_H
#define QV_BENCH_WORKLOAD_H

#include <string>

// A provider database of iContacts realistic contacts and the index built from it, in a directory
// of their own that is removed with the object. It becomes the library's data directory.
class CWorkload
{
public:
    // With a surname, all contacts bear it.
    explicit CWorkload(int iContacts, wchar_t surname = 0);
    ~CWorkload();
    CWorkload(const CWorkload&) = delete;
    CWorkload& operator=(const CWorkload&) = delete;

    int Contacts() const { return m_iContacts; }
    wchar_t Surname() const { return m_surname; }
    // Makes the directory the library's again after another workload was made.
    void Activate() const;

private:
    void FillDatabase() const;

    int m_iContacts;
    wchar_t m_surname;
    std::string m_strRoot;
};

#endif
