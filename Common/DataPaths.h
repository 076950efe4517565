#ifndef QV_COMMON_DATAPATHS_H
#define QV_COMMON_DATAPATHS_H

#include "Common/Export.h"

// The paths of the provider's files. On a device they never change; SetRoot lets tests and the tool
// work in another directory.
// The library reads no environment variable and no configuration file.
class QV_EXPORT CDataPaths
{
public:
    // Puts all paths under szRoot (UTF-8, at most 4000 bytes, without a slash at its end) instead
    // of /data/data/com.android.providers.contacts. Called once, before anything else of the
    // library; null restores the device's paths. 0, or -1 with nothing changed for a root that
    // is too long. Not synchronised.
    static int SetRoot(const char* szRoot);

    // Paths of files that may or may not exist; valid until the next SetRoot.
    static const char* Database();       // databases/contacts2.db
    static const char* PinyinSource();   // files/pyfile.bin
    static const char* PinyinMapping();  // files/PyFileMappint.bin
    static const char* ContactRecords(); // files/ContactsLocalizer.bin
    static const char* ContactReg();     // files/ContactsReg.bin
    static const char* LockFile();       // files/memlock.ini
};

#endif
