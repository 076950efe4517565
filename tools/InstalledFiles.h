#ifndef QV_TOOLS_INSTALLEDFILES_H
#define QV_TOOLS_INSTALLEDFILES_H

#include <string>

// The files that were installed with the program, else those of its build.
std::string DefaultPinyinTable();
std::string DefaultConverter();

// Copies the table to where the library looks for it. Throws CToolError.
void InstallPinyinTable(const std::string& strSource);

#endif
