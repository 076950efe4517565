#ifndef QV_DBOPERATOR_CONTACTROW_H
#define QV_DBOPERATOR_CONTACTROW_H

// From the columns of a row to the fields of a record. The record was zero-filled; flag bits are
// ORed into it. Columns may hold NULL or any type.

#include "Core/Records/ContactRecords.h"

class CSqlStatement;

// Columns that are looked at outside of the filling.
constexpr int CONTACTS_STATUS_COLUMN = 7; // status_update_id, where the query asks for it
constexpr int LOCALIZER_ID_COLUMN = 0;    // contact_id

// Ids that a group list keeps: in a full read one element is left for SECRET_GROUP_ID.
constexpr int ROW_GROUPS = CONTACT_MAX_GROUPS - 1;
constexpr int SINGLE_ROW_GROUPS = CONTACT_MAX_GROUPS;

// Columns: _id, times_contacted, starred, has_phone_number, last_time_contacted,
// single_is_secret, photo_file_id (not kept).
void FillFromContactsRow(const CSqlStatement& clRow, tag_ContactsStruct* pContact);

// Columns: contact_id (not looked at), display_name, localizerkey, group_id, account_id, hasMail,
// hasAddress. Comes after the contacts row, which tells whether the contact is secret. False when
// memory ran out, so that a text is missing.
bool FillFromLocalizerRow(const CSqlStatement& clRow, int iMaxGroups, tag_ContactsStruct* pContact);

// As CSQLiteOperator::ParseIDString.
void ParseIdText(const char* szText, QVLong32* pIds, int iMax);

#endif
