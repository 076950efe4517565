#ifndef QVLOCALIZE_H
#define QVLOCALIZE_H

// Contact search by pinyin, initials and keypad digits, for C and for all languages that can call
// C: link libqvlocalize.so.1, which exports the functions of this header and nothing else.
//
// Order: qv_open; qv_build; then searches, keys and notifications in any order; qv_result_free for
// every result; qv_close. The index lies in files below the data directory, outlives the process
// and is the same for every process that opens that directory:
//   databases/contacts2.db  the contacts, read only
//   files/pyfile.bin        the pinyin table that comes with the library; it is not changed, but
//                           must be writable for the process that builds
//   files/                  what the library writes; the directory must exist
//
// Text is UTF-8, zero-terminated, of any Unicode characters; sizes count bytes, positions in names
// and texts count characters. Malformed, overlong and surrogate bytes are QV_ERROR_UTF8.
//
// Results are QV_OK or one of the negative codes, unless a function says otherwise; qv_strerror
// describes them. A failed call leaves its out arguments as they were, except that the pointers
// that would receive an index or a result become null.
//
// Threads: the library starts none and synchronises only qv_open and qv_close. Calls on one index
// must come one at a time, and so must calls that search within or release one result; any thread
// may read a result meanwhile. Searches on different indexes may run concurrently. Processes, and
// indexes within one, exclude each other by a lock on files/memlock.ini. A function that waits for
// it says how long.
//
// When the library opens a file for writing, or the lock, it sets the file-creation mask of the
// process to 0 and does not restore it; its files have the permission bits 0777, and the mode of
// files/, usually 0700, protects them. A process that needs its own mask sets it again after a
// call.

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C"
{
#endif

#if defined(__GNUC__)
// What the library exports.
#define QV_API __attribute__((visibility("default")))
#else
#define QV_API
#endif

    // What functions return.
    enum qv_status
    {
        QV_OK = 0,
        QV_ERROR_ARGUMENT = -1,        // null, or a value that has no meaning there
        QV_ERROR_MEMORY = -2,          // an allocation failed
        QV_ERROR_UTF8 = -3,            // a text is not UTF-8
        QV_ERROR_TOO_LONG = -4,        // a text has too many characters
        QV_ERROR_BUFFER = -5,          // the caller's buffer is too small
        QV_ERROR_DIRECTORY = -6,       // the data directory is missing or its path is too long
        QV_ERROR_OTHER_DIRECTORY = -7, // the process has another data directory open
        QV_ERROR_DATABASE = -8,        // the contacts database is missing or not readable
        QV_ERROR_PINYIN = -9,          // the pinyin table is missing or cannot be mapped
        QV_ERROR_STORE = -10,     // database or index files: locked, full, damaged, not writable
        QV_ERROR_CHARACTER = -11, // the pinyin table does not have the character
        QV_ERROR_NOT_BUILT = -12, // there is no index to search yet
        QV_ERROR_PLATFORM = -13   // not available on this platform
    };

    // What the typed text is and where it is searched.
    enum qv_kind
    {
        QV_KIND_WORD = 0,   // letters and Chinese characters, among the contacts
        QV_KIND_DIGITS = 1, // keypad digits, among the contacts
        QV_KIND_SPECIAL = 2 // letters, among the seven fixed special numbers, whose ids are 0 to 6
    };

    // What a filter keeps. The id is that of a group, an account or a contact; kinds without one
    // ignore it.
    enum qv_filter_kind
    {
        QV_FILTER_GROUP = 0,        // members of the group; group -1: secret contacts
        QV_FILTER_ACCOUNT = 1,      // contacts with data in the account
        QV_FILTER_PHONE = 2,        // contacts with a phone number
        QV_FILTER_STARRED = 5,      // favourites
        QV_FILTER_NOT_GROUP = 6,    // contacts outside the group
        QV_FILTER_MAIL = 7,         // contacts with a mail address
        QV_FILTER_POSTAL = 8,       // contacts with a postal address
        QV_FILTER_NOT_ACCOUNT = 9,  // contacts not confined to the accounts of these filters
        QV_FILTER_NOT_CONTACT = 10, // all contacts but the one with the id
        QV_FILTER_ONLINE = 11       // contacts that are online
    };

    // Order of the contacts in the index, which is the order of an empty text's matches.
    enum qv_sort_type
    {
        QV_SORT_NAME = 0, // by name in pinyin
        QV_SORT_TIME = 1  // last contacted first
    };

#define QV_MAX_TYPED 10    // characters of a typed text
#define QV_KEY_SIZE 31     // bytes that hold any localizer key and its terminator
#define QV_PICK_SIZE 53    // bytes that hold any text of qv_pick and its terminator
#define QV_MAX_SECTIONS 32 // sections of a result, at most

// Bits of qv_next_keys: the letter 'a' + n is bit n.
#define QV_KEY_LETTER(letter) (UINT32_C(1) << ((letter) - 'a'))
#define QV_KEY_OTHER UINT32_C(0x4000000) // digits and other characters

    // An open data directory.
    typedef struct qv_index qv_index;

    // What a search found: a copy, which later changes of the index do not affect.
    typedef struct qv_result qv_result;

    // One condition on contacts.
    typedef struct qv_filter
    {
        int32_t kind; // QV_FILTER_*
        int32_t id;   // of a group, an account or a contact
    } qv_filter;

    // What to search for. A match passes every filter; filters are ignored within a previous result
    // and for special numbers.
    typedef struct qv_query
    {
        const char* text;         // at most QV_MAX_TYPED characters; empty lists all
        int32_t kind;             // QV_KIND_*
        const qv_filter* filters; // may be null when there are none
        size_t filter_count;      // of filters
    } qv_query;

    // One found contact.
    typedef struct qv_match
    {
        int32_t contact_id;   // as in the database
        int32_t name_order;   // its place among all contacts in name order
        uint32_t codes[11];   // the name as it is matched, one code per character, 0 after the last
        uint32_t reserved[5]; // always 0 in an index that this library wrote
        uint16_t last;        // last matched character of the name; 0 for an empty text
        uint16_t first;       // first matched character of the name, from 0
        int32_t index_character; // for an empty text 'A' to 'Z' or '#', in time order '1' to '5'
                                 // (less than 30, 90, 180, 360 days ago, longer); else 0
        int64_t last_contacted;  // milliseconds since 1970, UTC; 0 for never
    } qv_match;

    // The matches of an empty text with one index character.
    typedef struct qv_section
    {
        int32_t label; // the index character; '#' also for contacts without one
        int32_t first; // place of the first such match in the result
        int32_t count; // matches, which need not all follow each other
    } qv_section;

    // Receives a line of the library's log: priority 3 (progress) or 6 (an error), tag and text,
    // which are valid during the call. It must not call the library.
    typedef void (*qv_log_function)(void* userdata, int priority, const char* tag,
                                    const char* text);

    // Describes a result, in English; for an unknown number the text says so. Never null.
    QV_API const char* qv_strerror(int status);

    // Sends the log lines of the whole process to callback, with userdata; null restores the
    // default: errors go to standard error, progress is dropped. Call it while no other call of the
    // library runs. QV_ERROR_PLATFORM on Android, where the lines are in the system's log.
    QV_API int qv_set_log(qv_log_function callback, void* userdata);

    // Opens a data directory, which must exist, into *index; null means that of the contacts
    // provider on Android, /data/data/com.android.providers.contacts. Reads no file. A process has
    // one data directory at a time: while an index is open, another directory is
    // QV_ERROR_OTHER_DIRECTORY; the same one, however its path is written, may be opened again.
    QV_API int qv_open(const char* data_dir, qv_index** index);
    // Closes an index; its files stay, and so do its results. Null is allowed.
    QV_API void qv_close(qv_index* index);

    // 1 when there is no index to search, 0 when there is one; QV_ERROR_ARGUMENT for null.
    QV_API int qv_needs_build(qv_index* index);
    // Builds the index from the database, unless force is 0 and the index is complete. The lock is
    // tried for a second, then QV_ERROR_STORE. After a failure the old index stays. Only one
    // process at a time may build, change the database and send notifications.
    QV_API int qv_build(qv_index* index, int force);

    // Searches into *result: within previous, which is only read and stays the caller's, or, when
    // that is null, within all contacts that pass the filters. The best match comes first. An index
    // that another process keeps locked for a second gives a result without matches, and error
    // lines.
    QV_API int qv_search(qv_index* index, const qv_query* query, const qv_result* previous,
                         qv_result** result);
    // Releases a result. Null is allowed; the index may be closed.
    QV_API void qv_result_free(qv_result* result);

    // The number of matches, and the matches as an array that lives as long as the result; null
    // when there are none. A null result has none.
    QV_API size_t qv_result_count(const qv_result* result);
    QV_API const qv_match* qv_result_matches(const qv_result* result);
    // Points *page at count matches from start on, without copying them. QV_ERROR_ARGUMENT for
    // matches beyond the end; with a count of 0, start may be the end.
    QV_API int qv_result_page(const qv_result* result, size_t start, size_t count,
                              const qv_match** page);
    // The place of a contact in the result, or -1.
    QV_API ptrdiff_t qv_result_find(const qv_result* result, int32_t contact_id);
    // Writes the sections of an empty text's result, letters before '#', times from the latest on,
    // and returns how many there are. 0 for any other text and for a null argument.
    QV_API size_t qv_result_sections(const qv_result* result, qv_section sections[QV_MAX_SECTIONS]);
    // The keys that can usefully be typed next, QV_KEY_*. 0 for a null result.
    QV_API uint32_t qv_next_keys(const qv_result* result);
    // The Chinese characters that the last typed letters may stand for, one after another, at
    // most 20; valid as long as the result. Empty for a null result.
    QV_API const char* qv_candidates(const qv_result* result);

    // Writes the localizer key of a name, which the contacts database keeps in
    // localizer.localizerkey: one code per character for its first ten characters. QV_KEY_SIZE
    // bytes are enough. If the index was never built, the shared copy of the pinyin table is
    // written first.
    QV_API int qv_localizer_key(qv_index* index, const char* name, char* buffer, size_t size);
    // The same for count names with one mapping of the pinyin table. Nothing is written unless all
    // names are UTF-8.
    QV_API int qv_localizer_keys(qv_index* index, const char* const* names, size_t count,
                                 char (*keys)[QV_KEY_SIZE]);

    // Writes the text that is searched after the user picked word, a character of qv_candidates,
    // for the letters that end before the character at position: the text up to the last letter
    // before position that begins a reading of word, in capitals, and word. Where no letter fits,
    // the text in small letters. A word of up to three letters or digits is appended. text has at
    // most QV_MAX_TYPED characters; a position after its end is the end. QV_PICK_SIZE bytes are
    // enough. QV_ERROR_CHARACTER for a character that the pinyin table does not have.
    QV_API int qv_pick(qv_index* index, const char* text, int position, const char* word,
                       char* buffer, size_t size);

    // Notifications, after the change is in the database. They wait for the lock without limit, a
    // rebuild for a second. Their failures are in the log, and the next notification of contacts or
    // status rebuilds the index.

    // These contacts were added, changed or removed. Contacts that are added or removed together
    // are named in one call. For more than 200 the index is rebuilt.
    QV_API int qv_contacts_changed(qv_index* index, const int64_t* ids, size_t count);
    // Any contacts may have changed: rebuilds the index.
    QV_API int qv_all_contacts_changed(qv_index* index);
    // Who is online changed.
    QV_API int qv_status_changed(qv_index* index);
    // The contact was contacted at time, milliseconds since 1970, UTC.
    QV_API int qv_time_changed(qv_index* index, int32_t contact_id, int64_t time);
    // The contact became a favourite, or with 0 ceased to be one.
    QV_API int qv_star_changed(qv_index* index, int32_t contact_id, int starred);

    // The order of the index, QV_SORT_*; QV_SORT_NAME if there is no index. QV_ERROR_ARGUMENT
    // for null.
    QV_API int qv_get_sort_type(qv_index* index);
    // Sets the order, which takes effect with the next build or notification of contacts or status.
    // QV_ERROR_STORE if there is no index.
    QV_API int qv_set_sort_type(qv_index* index, int sort_type);

#ifdef __cplusplus
}
#endif

#endif
