#ifndef QV_CORE_RECORDS_CONTACTRECORDS_H
#define QV_CORE_RECORDS_CONTACTRECORDS_H

// The contact record and the registration record: the bytes of the store files, little-endian,
// the same in memory, on disk and on every processor. Files already on devices hold them.

#include <cstddef>
#include <cstdint>
#include <type_traits>

static_assert(sizeof(wchar_t) == 4, "text is kept in 32-bit units");

// An element of the 32-bit arrays that the interface calls long (ids of groups, accounts and
// filters): long itself where it has 32 bits, so that names exported there are those of long.
using QVLong32 = std::conditional<sizeof(long) == sizeof(int32_t), long, int32_t>::type;
static_assert(sizeof(QVLong32) == 4, "ids are 32-bit fields of the record");

// Sizes of a record's lists and texts.
constexpr int CONTACT_MAX_GROUPS = 100;
constexpr int CONTACT_MAX_ACCOUNTS = 20;
constexpr int CONTACT_MAX_NAME = 30; // characters of szName before its terminator
constexpr int CONTACT_MAX_KEY = 10;  // codes of szLocalizerKey before its terminator

// Bits of iFlags.
constexpr uint32_t CONTACT_FLAG_SECRET = 0x01;
constexpr uint32_t CONTACT_FLAG_MAIL = 0x02;
constexpr uint32_t CONTACT_FLAG_PHONE = 0x04;
constexpr uint32_t CONTACT_FLAG_STARRED = 0x08;
constexpr uint32_t CONTACT_FLAG_ADDRESS = 0x10;
constexpr uint32_t CONTACT_FLAG_ONLINE = 0x20;

// The group that secret contacts belong to, so that group filters can select or exclude them.
constexpr QVLong32 SECRET_GROUP_ID = -1;

// First unit of a nameless contact's szName; it sorts behind every name.
constexpr wchar_t NAME_EMPTY_MARK = 0x7FFFFFFF;

// Slots that a full build leaves free for contacts added later.
constexpr int STORE_SPARE_RECORDS = 1000;

// Orders of the stored records.
constexpr int STORE_ORDER_NAME = 0;
constexpr int STORE_ORDER_TIME = 1; // last contacted first

// One contact. A record is created zero-filled; the reader ORs flag bits into it.
struct tag_ContactsStruct
{
    int32_t iContactID;                          // the provider's _id
    QVLong32 lGroupID[CONTACT_MAX_GROUPS];       // ends at the first 0
    QVLong32 lAccountID[CONTACT_MAX_ACCOUNTS];   // ends at the first 0
    uint32_t iFlags;                             // CONTACT_FLAG_*
    int32_t iSortIndex;                          // place in name order, from 0
    int32_t iPadding;                            // always 0; brings the time to 8 bytes
    int64_t llLastTimeContacted;                 // milliseconds since 1970, UTC
    int32_t iTimesContacted;                     // how often
    int32_t iStatusUpdateID;                     // its latest status update, 0 for none
    wchar_t szName[CONTACT_MAX_NAME + 1];        // display name, then its pinyin key
    wchar_t szLocalizerKey[CONTACT_MAX_KEY + 1]; // localizer codes, one per name character
    wchar_t szReserved[6];                       // never written, always 0
};
static_assert(sizeof(tag_ContactsStruct) == 704, "the record is the file");
static_assert(offsetof(tag_ContactsStruct, lGroupID) == 4, "file layout");
static_assert(offsetof(tag_ContactsStruct, lAccountID) == 404, "file layout");
static_assert(offsetof(tag_ContactsStruct, iFlags) == 484, "file layout");
static_assert(offsetof(tag_ContactsStruct, iSortIndex) == 488, "file layout");
static_assert(offsetof(tag_ContactsStruct, llLastTimeContacted) == 496, "file layout");
static_assert(offsetof(tag_ContactsStruct, iTimesContacted) == 504, "file layout");
static_assert(offsetof(tag_ContactsStruct, iStatusUpdateID) == 508, "file layout");
static_assert(offsetof(tag_ContactsStruct, szName) == 512, "file layout");
static_assert(offsetof(tag_ContactsStruct, szLocalizerKey) == 636, "file layout");
static_assert(offsetof(tag_ContactsStruct, szReserved) == 680, "file layout");
static_assert(std::is_trivially_copyable<tag_ContactsStruct>::value, "copied whole");

// An array of records with its count. The holder releases pContacts with array delete;
// null when nothing was read. Filters lower RecordNum and leave the allocation as it is.
struct tag_ContactsInfo
{
    int32_t RecordNum;             // records that count
    tag_ContactsStruct* pContacts; // the array, as long as it was allocated
};
static_assert(sizeof(void*) != 4 || sizeof(tag_ContactsInfo) == 8, "part of the interface");

// The whole content of ContactsReg.bin.
struct tag_ContactReg
{
    int32_t iTotalNum; // records stored in ContactsLocalizer.bin
    int32_t iSortType; // STORE_ORDER_*; any other value is kept and acts as name order
    int32_t iMemSize;  // capacity of ContactsLocalizer.bin in records; 0 asks for a rebuild
};
static_assert(sizeof(tag_ContactReg) == 12, "the record is the file");
static_assert(offsetof(tag_ContactReg, iSortType) == 4, "file layout");
static_assert(offsetof(tag_ContactReg, iMemSize) == 8, "file layout");

#endif
