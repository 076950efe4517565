#ifndef QV_TOOLS_RECORDTEXT_H
#define QV_TOOLS_RECORDTEXT_H

#include "Core/Records/ContactRecords.h"

#include <iosfwd>

// A stored record as one line of a table, and the table's heading with its legend.
void PrintRecordHeading(std::ostream& stream);
void PrintRecord(std::ostream& stream, const tag_ContactsStruct& record);

#endif
