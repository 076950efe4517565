#ifndef QV_TESTS_SUPPORT_DATADIRECTORY_H
#define QV_TESTS_SUPPORT_DATADIRECTORY_H

#include <string>

// A fresh data directory below the system's temporary one, with databases/ and files/, set as
// the library's root for as long as the object lives and removed with all it holds afterwards.
class CDataDirectory
{
public:
    CDataDirectory();
    ~CDataDirectory();
    CDataDirectory(const CDataDirectory&) = delete;
    CDataDirectory& operator=(const CDataDirectory&) = delete;

    const std::string& Root() const { return m_strRoot; }
    // Puts the built pinyin table where the library looks for its source.
    void InstallPinyinTable() const;

    // Path of files/szName.
    std::string File(const char* szName) const { return m_strRoot + "/files/" + szName; }
    static std::string ReadBytes(const std::string& strPath);
    static void WriteBytes(const std::string& strPath, const std::string& strBytes);

private:
    std::string m_strRoot;
};

#endif
