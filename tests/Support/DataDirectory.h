#ifndef QV_TESTS_SUPPORT_DATADIRECTORY_H
#define QV_TESTS_SUPPORT_DATADIRECTORY_H

#include "Common/DataPaths.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>

// A fresh data directory below the system's temporary one, with databases/ and files/, set as
// the library's root for as long as the object lives and removed with all it holds afterwards.
class CDataDirectory
{
public:
    CDataDirectory()
    {
        if (mkdtemp(m_strRoot.data()) == nullptr)
        {
            throw std::runtime_error("no temporary directory: " + m_strRoot);
        }
        std::filesystem::create_directory(m_strRoot + "/databases");
        std::filesystem::create_directory(m_strRoot + "/files");
        CDataPaths::SetRoot(m_strRoot.c_str());
    }
    ~CDataDirectory()
    {
        CDataPaths::SetRoot(nullptr);
        std::error_code error;
        std::filesystem::remove_all(m_strRoot, error);
    }
    CDataDirectory(const CDataDirectory&) = delete;
    CDataDirectory& operator=(const CDataDirectory&) = delete;

    const std::string& Root() const { return m_strRoot; }
    // Path of files/szName.
    std::string File(const char* szName) const { return m_strRoot + "/files/" + szName; }
    // Puts the built pinyin table where the library looks for its source.
    void InstallPinyinTable() const
    {
        std::filesystem::copy_file(QV_PYFILE, CDataPaths::PinyinSource(),
                                   std::filesystem::copy_options::overwrite_existing);
    }

    static std::string ReadBytes(const std::string& strPath)
    {
        std::ostringstream bytes;
        bytes << std::ifstream(strPath, std::ios::binary).rdbuf();
        return bytes.str();
    }
    static void WriteBytes(const std::string& strPath, const std::string& strBytes)
    {
        std::ofstream(strPath, std::ios::binary | std::ios::trunc) << strBytes;
    }

private:
    std::string m_strRoot = std::filesystem::temp_directory_path() / "qv_XXXXXX";
};

#endif
