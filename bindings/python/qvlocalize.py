"""Contact search by pinyin, initials and keypad digits: libqvlocalize for Python.

    import qvlocalize

    with qvlocalize.Index("/srv/contacts") as index:
        index.build()
        for match in index.search("zs", starred=True):
            print(match.contact_id, match.first, match.last)

        with index.typing(phone=True) as typing:   # each key searches within the matches before it
            typing.type("z")
            typing.type("h")
            print(len(typing.result), typing.result.next_keys, typing.result.candidates)

A process has one data directory open at a time. Calls on one index, from any threads, wait for each
other. Failures raise Error, with the library's description and a Status as its code. The module
finds libqvlocalize.so.1 at QVLOCALIZE_LIBRARY, in its own installation, or in the system's library
path.

In the examples below, index is the index of the sample that "qvlocalize sample" makes, database is
a connection to the sample's contacts2.db, and names has the contacts' names by their ids.
"""

from __future__ import annotations

import ctypes
import dataclasses
import enum
import os
import pathlib
import sysconfig
import threading
import weakref
from collections.abc import Iterable, Sequence
from typing import Any, Callable, Iterator, List, NamedTuple, Optional, Tuple, Union, overload

__all__ = ["Error", "Index", "Kind", "Match", "Result", "Section", "SortType", "Status", "Typing",
           "set_log"]


class Status(enum.IntEnum):
    """What the library's functions return; qvlocalize.h describes it."""
    OK = 0
    ERROR_ARGUMENT = -1
    ERROR_MEMORY = -2
    ERROR_UTF8 = -3
    ERROR_TOO_LONG = -4
    ERROR_BUFFER = -5
    ERROR_DIRECTORY = -6
    ERROR_OTHER_DIRECTORY = -7
    ERROR_DATABASE = -8
    ERROR_PINYIN = -9
    ERROR_STORE = -10
    ERROR_CHARACTER = -11
    ERROR_NOT_BUILT = -12
    ERROR_PLATFORM = -13


class Kind(enum.IntEnum):
    """What the typed text is and where it is searched."""
    WORD = 0     # letters and Chinese characters, among the contacts
    DIGITS = 1   # keypad digits, among the contacts
    SPECIAL = 2  # letters, among the seven fixed special numbers


class SortType(enum.IntEnum):
    """Order of the contacts in the index."""
    NAME = 0  # by name in pinyin
    TIME = 1  # last contacted first


class _FilterKind(enum.IntEnum):
    GROUP = 0
    ACCOUNT = 1
    PHONE = 2
    STARRED = 5
    NOT_GROUP = 6
    MAIL = 7
    POSTAL = 8
    NOT_ACCOUNT = 9
    NOT_CONTACT = 10
    ONLINE = 11


_KINDS_WITH_ID = (_FilterKind.GROUP, _FilterKind.ACCOUNT, _FilterKind.NOT_GROUP,
                  _FilterKind.NOT_ACCOUNT, _FilterKind.NOT_CONTACT)

_KEY_SIZE = 31
_PICK_SIZE = 53
_MAX_SECTIONS = 32
_LETTERS = "abcdefghijklmnopqrstuvwxyz"
_OTHER_KEYS = "#"  # stands for digits and other characters among the next keys


class _Filter(ctypes.Structure):
    _fields_ = [("kind", ctypes.c_int32), ("id", ctypes.c_int32)]


class _Query(ctypes.Structure):
    _fields_ = [("text", ctypes.c_char_p), ("kind", ctypes.c_int32),
                ("filters", ctypes.POINTER(_Filter)), ("filter_count", ctypes.c_size_t)]


class _Match(ctypes.Structure):
    _fields_ = [("contact_id", ctypes.c_int32), ("name_order", ctypes.c_int32),
                ("codes", ctypes.c_uint32 * 11), ("reserved", ctypes.c_uint32 * 5),
                ("last", ctypes.c_uint16), ("first", ctypes.c_uint16),
                ("index_character", ctypes.c_int32), ("last_contacted", ctypes.c_int64)]


class _Section(ctypes.Structure):
    _fields_ = [("label", ctypes.c_int32), ("first", ctypes.c_int32), ("count", ctypes.c_int32)]


_LogFunction = ctypes.CFUNCTYPE(None, ctypes.c_void_p, ctypes.c_int, ctypes.c_char_p,
                                ctypes.c_char_p)


def _library_path() -> str:
    named = os.environ.get("QVLOCALIZE_LIBRARY")
    if named:
        return named
    soname = "libqvlocalize.so.1"
    for folder in pathlib.Path(__file__).resolve().parents:
        for library in (folder / soname,
                        folder / str(sysconfig.get_config_var("MULTIARCH")) / soname):
            if library.is_file():
                return str(library)
    return soname


def _load() -> ctypes.CDLL:
    library = ctypes.CDLL(_library_path())
    pointer, string, integer, size = (ctypes.c_void_p, ctypes.c_char_p, ctypes.c_int,
                                      ctypes.c_size_t)
    signatures = {
        "qv_strerror": (string, [integer]),
        "qv_set_log": (integer, [_LogFunction, pointer]),
        "qv_open": (integer, [string, ctypes.POINTER(pointer)]),
        "qv_close": (None, [pointer]),
        "qv_needs_build": (integer, [pointer]),
        "qv_build": (integer, [pointer, integer]),
        "qv_search": (integer, [pointer, ctypes.POINTER(_Query), pointer, ctypes.POINTER(pointer)]),
        "qv_result_free": (None, [pointer]),
        "qv_result_count": (size, [pointer]),
        "qv_result_matches": (ctypes.POINTER(_Match), [pointer]),
        "qv_result_find": (ctypes.c_ssize_t, [pointer, ctypes.c_int32]),
        "qv_result_sections": (size, [pointer, ctypes.POINTER(_Section)]),
        "qv_next_keys": (ctypes.c_uint32, [pointer]),
        "qv_candidates": (string, [pointer]),
        "qv_localizer_keys": (integer, [pointer, ctypes.POINTER(string), size, pointer]),
        "qv_pick": (integer, [pointer, string, integer, string, pointer, size]),
        "qv_contacts_changed": (integer, [pointer, ctypes.POINTER(ctypes.c_int64), size]),
        "qv_all_contacts_changed": (integer, [pointer]),
        "qv_status_changed": (integer, [pointer]),
        "qv_time_changed": (integer, [pointer, ctypes.c_int32, ctypes.c_int64]),
        "qv_star_changed": (integer, [pointer, ctypes.c_int32, integer]),
        "qv_get_sort_type": (integer, [pointer]),
        "qv_set_sort_type": (integer, [pointer, integer]),
    }
    for name, (result, arguments) in signatures.items():
        function = getattr(library, name)
        function.restype, function.argtypes = result, arguments
    return library


_lib = _load()


class Error(Exception):
    """A failure of the library, with its description and a Status.

    >>> index.search("zhangsansan")
    Traceback (most recent call last):
    qvlocalize.Error: a text has too many characters
    >>> try:
    ...     index.search("zhangsansan")
    ... except qvlocalize.Error as error:
    ...     error.code
    <Status.ERROR_TOO_LONG: -4>
    """

    def __init__(self, code: int):
        super().__init__(_lib.qv_strerror(code).decode())
        self.code = Status(code)


def _check(code: int) -> int:
    if code < 0:
        raise Error(code)
    return code


def _utf8(text: str) -> bytes:
    if "\0" in text:
        raise ValueError("the text has a null character in it")
    return text.encode()


def _int32(number: int) -> int:
    if not -2**31 <= number < 2**31:
        raise OverflowError(f"{number} has more than 32 bits")
    return number


_log_function = _LogFunction(0)  # kept for as long as the library may call it


def set_log(callback: Optional[Callable[[int, str, str], None]]) -> None:
    """Sends each line of the library's log to callback(priority, tag, text), priority 3 for
    progress and 6 for errors; None restores standard error for the errors. No other call of the
    library may run meanwhile, and the callback must not call it.

    >>> qvlocalize.set_log(lambda *line: print(line))
    >>> result = index.search("zs")
    (3, 'QV_Localize', 'QV_Contacts: Search Start')
    ...
    >>> qvlocalize.set_log(None)
    >>> result = index.search("zs")
    """
    global _log_function
    function = _LogFunction(0)
    if callback is not None:
        receive = callback
        function = _LogFunction(lambda _userdata, priority, tag, text: receive(
            priority, tag.decode(errors="replace"), text.decode(errors="replace").rstrip()))
    _check(_lib.qv_set_log(function, None))
    _log_function = function


class Match(NamedTuple):
    """One found contact."""
    contact_id: int
    name_order: int       # its place among all contacts in name order
    last_contacted: int   # milliseconds since 1970, UTC; 0 for never
    first: int            # first matched character of the name, from 0
    last: int             # last matched character; both 0 for an empty text
    index_character: str  # for an empty text "A" to "Z" or "#", in time order "1" to "5"; else ""


@dataclasses.dataclass(frozen=True)
class Section:
    """The matches of an empty text with one index character."""
    label: str
    first: int  # place of the first of them
    count: int


def _match(entry: _Match) -> Match:
    return Match(entry.contact_id, entry.name_order, entry.last_contacted, entry.first, entry.last,
                 chr(entry.index_character) if entry.index_character else "")


class Result(Sequence):
    """What a search found, the best match first. Later changes of the index do not affect it, and
    it may outlive the index. It is released with the object, by close, or at the end of a with.

    >>> result = index.search("zhangsan")
    >>> len(result)
    4
    >>> result[-1]
    Match(contact_id=4, name_order=233, last_contacted=..., first=1, last=2, index_character='')
    >>> [names[match.contact_id] for match in result]
    ['张三', '張三豐', '章三', '李张三']
    >>> [names[match.contact_id] for match in result[1:4:2]]
    ['張三豐', '李张三']
    """

    def __init__(self, pointer: ctypes.c_void_p, lock: threading.Lock):
        self._pointer = pointer
        self._lock = lock
        self._release = weakref.finalize(self, _lib.qv_result_free, pointer)
        self._count = _lib.qv_result_count(pointer)
        self._matches = _lib.qv_result_matches(pointer)

    def close(self) -> None:
        """Releases the matches; the result cannot be used any more.

        >>> with index.search("zhangsan") as result:
        ...     contact_ids = [match.contact_id for match in result]
        >>> len(result)
        Traceback (most recent call last):
        ValueError: the result is closed
        """
        with self._lock:
            self._release()

    def __enter__(self) -> Result:
        return self

    def __exit__(self, *_exception: object) -> None:
        self.close()

    def _open(self) -> ctypes.c_void_p:
        if not self._release.alive:
            raise ValueError("the result is closed")
        return self._pointer

    def __len__(self) -> int:
        self._open()
        return self._count

    @overload
    def __getitem__(self, place: int) -> Match: ...
    @overload
    def __getitem__(self, place: slice) -> List[Match]: ...

    def __getitem__(self, place: Union[int, slice]) -> Union[Match, List[Match]]:
        places = range(len(self))[place]
        if isinstance(places, range):
            return [_match(self._matches[i]) for i in places]
        return _match(self._matches[places])

    def __iter__(self) -> Iterator[Match]:
        for place in range(len(self)):
            yield self[place]

    def find(self, contact_id: int) -> Optional[int]:
        """The place of a contact, None when it is not among the matches.

        >>> result = index.search("zhangsan")
        >>> result.find(6), result.find(54)
        (2, None)
        """
        place = _lib.qv_result_find(self._open(), _int32(contact_id))
        return place if place >= 0 else None

    @property
    def next_keys(self) -> str:
        """The letters that can usefully be typed next, and "#" for digits and other characters.

        >>> index.search("zha", starred=True).next_keys
        'nosxy#'
        """
        mask = _lib.qv_next_keys(self._open())
        return "".join(key for bit, key in enumerate(_LETTERS + _OTHER_KEYS) if mask >> bit & 1)

    @property
    def candidates(self) -> str:
        """The Chinese characters that the last typed letters may stand for, at most 20.

        >>> index.search("zha", starred=True).candidates
        '朝张赵涵'
        """
        return _lib.qv_candidates(self._open()).decode()

    @property
    def sections(self) -> List[Section]:
        """The sections of an empty text's matches; none for any other text.

        >>> result = index.search("", starred=True)
        >>> section = result.sections[2]
        >>> section
        Section(label='C', first=7, count=2)
        >>> [names[match.contact_id] for match in result[section.first:][:section.count]]
        ['Carlos Dubois', '曹伟']
        >>> result[section.first].index_character
        'C'
        """
        found = (_Section * _MAX_SECTIONS)()
        count = _lib.qv_result_sections(self._open(), found)
        return [Section(chr(section.label), section.first, section.count)
                for section in found[:count]]


Ids = Union[int, Iterable[int], None]


class Index:
    """The index of a data directory, None being the contacts provider's on Android. Closed by close
    or at the end of a with. Before that the process opens no other data directory:

    >>> qvlocalize.Index("/var")
    Traceback (most recent call last):
    qvlocalize.Error: the process has another data directory open
    """

    def __init__(self, data_dir: Union[str, os.PathLike, None] = None):
        path = os.fsencode(data_dir) if data_dir is not None else None
        pointer = ctypes.c_void_p()
        _check(_lib.qv_open(path, ctypes.byref(pointer)))
        self._pointer = pointer
        self._lock = threading.Lock()
        self._release = weakref.finalize(self, _lib.qv_close, pointer)

    def close(self) -> None:
        """Closes the index; its files stay, and so do its results."""
        with self._lock:
            self._release()

    def __enter__(self) -> Index:
        return self

    def __exit__(self, *_exception: object) -> None:
        self.close()

    def _call(self, function: Callable[..., int], *arguments: object) -> int:
        with self._lock:
            if not self._release.alive:
                raise ValueError("the index is closed")
            return _check(function(self._pointer, *arguments))

    @property
    def needs_build(self) -> bool:
        """Whether there is no index to search yet.

        >>> index.needs_build
        False
        """
        return self._call(_lib.qv_needs_build) != 0

    def build(self, force: bool = False) -> None:
        """Builds the index from the database, unless force is False and it is complete."""
        self._call(_lib.qv_build, force)

    def search(self, text: str, kind: Kind = Kind.WORD, *, within: Optional[Result] = None,
               starred: bool = False, phone: bool = False, mail: bool = False,
               postal: bool = False, online: bool = False, group: Ids = None, account: Ids = None,
               not_group: Ids = None, not_account: Ids = None, not_contact: Ids = None) -> Result:
        """Searches for at most ten characters, or lists all for an empty text, among the contacts
        that pass all filters, or within an earlier result, which is not changed and for which
        filters are ignored. Filters with an id take one or several; group -1: secret contacts.

        >>> def found(*text, **filters):
        ...     return [names[match.contact_id] for match in index.search(*text, **filters)]
        >>> found("zhangsan", group=2)
        ['张三', '李张三']
        >>> found("张s", group=[1, 2], phone=True)
        ['张三']
        >>> found("94264726", qvlocalize.Kind.DIGITS, not_contact=[1, 4])
        ['張三豐', '章三']
        >>> found("zsf", within=index.search("zs"))
        ['張三豐']
        >>> found("zsf", within=index.search("zs", group=99))
        []
        """
        filters = _filters(starred=starred, phone=phone, mail=mail, postal=postal, online=online,
                           group=group, account=account, not_group=not_group,
                           not_account=not_account, not_contact=not_contact)
        query = _Query(_utf8(text), kind, (_Filter * len(filters))(*filters), len(filters))
        found = ctypes.c_void_p()
        self._call(_lib.qv_search, ctypes.byref(query),
                   within._open() if within is not None else None, ctypes.byref(found))
        return Result(found, self._lock)

    def typing(self, kind: Kind = Kind.WORD, **filters: Any) -> Typing:
        """A typing session with the filters of search."""
        return Typing(self, kind, **filters)

    def localizer_key(self, name: str) -> str:
        """The key of a name, which the database keeps in localizer.localizerkey.

        >>> index.localizer_key("张三")
        'ᰠစ'
        """
        return self.localizer_keys([name])[0]

    def localizer_keys(self, names: Sequence[str]) -> List[str]:
        """The keys of many names with one mapping of the pinyin table.

        >>> index.localizer_keys(["张三", "Tom 2"])
        ['ᰠစ', '伓伎伌倀娂']
        """
        texts = (ctypes.c_char_p * len(names))(*[_utf8(name) for name in names])
        keys = ((ctypes.c_char * _KEY_SIZE) * len(names))()
        self._call(_lib.qv_localizer_keys, texts, len(names), keys)
        return [key.value.decode() for key in keys]

    def pick(self, text: str, position: int, character: str) -> str:
        """The text that is searched after character was picked for the letters before position.

        >>> index.pick("zhangs", 6, "三")
        'ZHANG三'
        """
        buffer = ctypes.create_string_buffer(_PICK_SIZE)
        self._call(_lib.qv_pick, _utf8(text), _int32(position), _utf8(character), buffer,
                   _PICK_SIZE)
        return buffer.value.decode()

    def contacts_changed(self, ids: Iterable[int]) -> None:
        """These contacts were added, changed or removed, and the database has the change.

        >>> with database:
        ...     cursor = database.execute(
        ...         "UPDATE localizer SET display_name = ?, localizerkey = ? WHERE contact_id = ?",
        ...         ("张三", index.localizer_key("张三"), 54))
        >>> index.contacts_changed([54])
        >>> [match.contact_id for match in index.search("zhangsan")]
        [54, 1, 5, 6, 4]
        """
        changed = list(ids)
        self._call(_lib.qv_contacts_changed, (ctypes.c_int64 * len(changed))(*changed),
                   len(changed))

    def all_contacts_changed(self) -> None:
        """Any contacts may have changed: rebuilds the index.

        >>> with database:
        ...     cursor = database.execute("DELETE FROM visible_contacts WHERE _id IN (1, 6)")
        >>> index.all_contacts_changed()
        >>> [names[match.contact_id] for match in index.search("zhangsan")]
        ['張三豐', '李张三']
        """
        self._call(_lib.qv_all_contacts_changed)

    def status_changed(self) -> None:
        """Who is online changed.

        >>> with database:
        ...     cursor = database.execute(
        ...         "UPDATE status_updates SET status = 'online' "
        ...         "WHERE status_update_data_id = 1005")
        >>> index.status_changed()
        >>> [names[match.contact_id] for match in index.search("zhangsan", online=True)]
        ['章三']
        """
        self._call(_lib.qv_status_changed)

    def time_changed(self, contact_id: int, time: int) -> None:
        """The contact was contacted at time, in milliseconds since 1970.

        >>> index.time_changed(54, 1_800_000_000_123)
        >>> index.search("tom")[0].last_contacted
        1800000000123
        """
        self._call(_lib.qv_time_changed, _int32(contact_id), time)

    def star_changed(self, contact_id: int, starred: bool) -> None:
        """The contact became a favourite or ceased to be one.

        >>> index.star_changed(54, True)
        >>> [match.contact_id for match in index.search("tom", starred=True)]
        [54]
        """
        self._call(_lib.qv_star_changed, _int32(contact_id), starred)

    @property
    def sort_type(self) -> SortType:
        """The order of the index; a new one takes effect with the next build or notification of
        contacts or status.

        >>> index.sort_type = qvlocalize.SortType.TIME
        >>> index.build(force=True)
        >>> index.sort_type, names[index.search("")[0].contact_id]
        (<SortType.TIME: 1>, '郭秀英')
        """
        return SortType(self._call(_lib.qv_get_sort_type))

    @sort_type.setter
    def sort_type(self, sort_type: SortType) -> None:
        self._call(_lib.qv_set_sort_type, sort_type)


def _filters(**wanted: Union[bool, Ids]) -> List[_Filter]:
    filters = []
    for name, value in wanted.items():
        kind = _FilterKind[name.upper()]
        if kind in _KINDS_WITH_ID:
            ids = [] if value is None else [value] if isinstance(value, int) else list(value)
        else:
            ids = [0] if value else []
        filters += [_Filter(kind, _int32(identity)) for identity in ids]
    return filters


class Typing:
    """A text that is typed key by key: each search narrows the matches before it, and keys can be
    taken back.

    >>> typing = index.typing(starred=True)
    >>> [len(typing.type(key)) for key in "zhangs"]
    [15, 15, 8, 5, 3, 1]
    >>> typing.result.candidates
    '三'
    >>> [names[match.contact_id] for match in typing.pick("三")]
    ['张三']
    >>> typing.text
    'zhang三'
    >>> len(typing.back()), typing.text
    (3, 'zhang')
    """

    def __init__(self, index: Index, kind: Kind, **filters: Any):
        self._index = index
        self._kind = kind
        self._filters = filters
        self._steps: List[Tuple[str, Result]] = []
        self._push("", None)

    def _push(self, text: str, within: Optional[Result]) -> None:
        result = self._index.search(text, self._kind, within=within, **self._filters)
        self._steps.append((text, result))

    def _step(self) -> Tuple[str, Result]:
        if not self._steps:
            raise ValueError("the session is closed")
        return self._steps[-1]

    @property
    def text(self) -> str:
        """What is typed so far."""
        return self._step()[0]

    @property
    def result(self) -> Result:
        """The matches of the text."""
        return self._step()[1]

    def type(self, keys: str) -> Result:
        """Appends the keys one by one and gives the matches."""
        for key in keys:
            self._push(self.text + key, self.result)
        return self.result

    def back(self) -> Result:
        """Removes the last key; an empty text stays empty.

        >>> with index.typing() as typing:
        ...     found = typing.back()
        >>> len(found)
        565
        """
        if len(self._steps) > 1:
            self._steps.pop()
        return self.result

    def pick(self, character: str) -> Result:
        """Replaces the last letters by a candidate character that they may stand for."""
        text = self._index.pick(self.text, len(self.text), character)
        kept = len(os.path.commonprefix([text.lower(), self.text.lower()]))
        del self._steps[kept + 1:]
        return self.type(text[kept:])

    def close(self) -> None:
        """Ends the session; results that the caller still holds stay valid.

        >>> with index.typing() as typing:
        ...     result = typing.type("zhangsan")
        >>> typing.text
        Traceback (most recent call last):
        ValueError: the session is closed
        >>> len(result)
        4
        """
        self._steps.clear()

    def __enter__(self) -> Typing:
        return self

    def __exit__(self, *_exception: object) -> None:
        self.close()
