#ifndef QV_DBOPERATOR_CONTACTROW_H
#define QV_DBOPERATOR_CONTACTROW_H

// Copies the columns of a row into the fields of a zero-filled record; flag bits are ORed into it.
// Columns may hold NULL or any type.

#include "Core/Records/ContactRecords.h"

class CSqlStatement;

// Columns that the reader itself uses.
constexpr int CONTACTS_STATUS_COLUMN = 7; // status_update_id, where the query asks for it
constexpr int LOCALIZER_ID_COLUMN = 0;    // contact_id

// Ids that a group list keeps: a full read leaves one element for SECRET_GROUP_ID.
constexpr int ROW_GROUPS = CONTACT_MAX_GROUPS - 1;
constexpr int SINGLE_ROW_GROUPS = CONTACT_MAX_GROUPS;

// Columns: _id, times_contacted, starred, has_phone_number, last_time_contacted,
// single_is_secret, photo_file_id (not kept).
void FillFromContactsRow(const CSqlStatement& row, tag_ContactsStruct* pContact);

// Columns: contact_id (ignored), display_name, localizerkey, group_id, account_id, hasMail,
// hasAddress. Call it after FillFromContactsRow, which sets the secret flag. False if SQLite failed
// to allocate a text, which is then missing.
bool FillFromLocalizerRow(const CSqlStatement& row, int iMaxGroups, tag_ContactsStruct* pContact);

// As CSQLiteOperator::ParseIDString.
void ParseIdText(const char* szText, QVLong32* pIds, int iMax);

#endif
