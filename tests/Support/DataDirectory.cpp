#include "tests/Support/DataDirectory.h"

#include "Common/DataPaths.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>

namespace fs = std::filesystem;

CDataDirectory::CDataDirectory()
{
    std::string strTemplate = (fs::temp_directory_path() / "qv_XXXXXX").string();
    if (mkdtemp(strTemplate.data()) == nullptr)
    {
        throw std::runtime_error("no temporary directory: " + strTemplate);
    }
    m_strRoot = strTemplate;
    fs::create_directory(m_strRoot + "/databases");
    fs::create_directory(m_strRoot + "/files");
    CDataPaths::SetRoot(m_strRoot.c_str());
}

CDataDirectory::~CDataDirectory()
{
    CDataPaths::SetRoot(nullptr);
    std::error_code error;
    fs::remove_all(m_strRoot, error);
}

void CDataDirectory::InstallPinyinTable() const
{
    fs::copy_file(QV_PYFILE, CDataPaths::PinyinSource(), fs::copy_options::overwrite_existing);
}

std::string CDataDirectory::ReadBytes(const std::string& strPath)
{
    std::ostringstream bytes;
    bytes << std::ifstream(strPath, std::ios::binary).rdbuf();
    return bytes.str();
}

void CDataDirectory::WriteBytes(const std::string& strPath, const std::string& strBytes)
{
    std::ofstream stream(strPath, std::ios::binary | std::ios::trunc);
    stream << strBytes;
}
