#!/usr/bin/python3
"""Turns contacts into JSON lines, as qvlocalize import reads them:

import_contacts.py vcard|csv CHARSET <FILE >LINES

CHARSET is that of text which does not name its own. A card or a row that cannot be read becomes a
line with the member "error". The members are told in the manual page of qvlocalize. Ends with 3
when vCards are asked for and the module vobject is not installed.
"""
import base64
import codecs
import csv
import io
import json
import re
import signal
import sys

NO_VOBJECT = 3
STARRED = {"starred", "* starred"}
EVERYBODY = {"mycontacts", "* mycontacts"}  # groups that hold all contacts are ignored
TRUE = {"1", "true", "yes", "y", "x", "是"}
FALSE = {"0", "false", "no", "n", "否"}
CHINESE = "\u2e80-\u303f\u3400-\u9fff\uf900-\ufaff\U00020000-\U0003ffff"


class Refused(Exception):
    """Why a card or a row is refused, and the line of the fault."""

    def __init__(self, reason, line=None):
        super().__init__(reason)
        self.line = line


# --- For cards and rows ---------------------------------------------------------------------------

def tidy(text):
    """The text on one line, with single blanks."""
    return " ".join(text.split())


def joined_name(prefix, given, additional, family, suffix):
    """Joins the parts of a name: a Chinese name has the family first and no blanks."""
    parts = [prefix, given, additional, family, suffix]
    if re.search(f"[{CHINESE}]", family + given):
        parts = [prefix, family, additional, given, suffix]
    name = tidy(" ".join(parts))
    return re.sub(f"(?<=[{CHINESE}]) (?=[{CHINESE}])", "", name)


def flag(text):
    """True or false, None for any other text."""
    text = text.strip().lower()
    return True if text in TRUE else False if text in FALSE else None


def entry_of(line, names, uid="", phones=(), mails=(), addresses=(), starred=None, groups=None):
    """The members of one contact; unknown ones are left out, so that they stay as they were."""
    phones, mails, addresses = ([text for text in map(tidy, texts) if text]
                                for texts in (phones, mails, addresses))
    names = [name for name in map(tidy, [*names, *mails, *phones]) if name]
    if not names:
        raise Refused("no name, mail address or phone number")
    entry = {"line": line, "name": names[0]}
    if uid.strip():
        entry["uid"] = uid.strip()
    for member, texts in (("phones", phones), ("mails", mails), ("addresses", addresses)):
        if texts:
            entry[member] = texts
    if groups is not None:
        groups = [group for group in map(tidy, groups) if group]
        if any(group.lower() in STARRED for group in groups):
            starred = True
        entry["groups"] = sorted({group for group in groups
                                  if group.lower() not in STARRED | EVERYBODY})
    if starred is not None:
        entry["starred"] = starred
    return entry


def decoded(octets, charset):
    try:
        return octets.decode(charset)
    except (UnicodeDecodeError, LookupError) as error:
        raise Refused(f"the text is not in {charset}") from error


# --- vCard ----------------------------------------------------------------------------------------

# A property up to its value. vobject's own pattern is very slow on some texts that do not match.
HEAD = re.compile(rb'(?:[\w-]+\.)?([\w-]+)'
                  rb'((?:;[\w-]+(?:=(?:"[^"]*"|[^";:,]*)(?:,(?:"[^"]*"|[^";:,]*))*)?)*);?:')
QUOTED_PRINTABLE = re.compile(rb"\bquoted-printable\b", re.IGNORECASE)
BASE64 = re.compile(rb"\b(?:base64|encoding=b)\b", re.IGNORECASE)
WANTED = {"UID", "KIND", "X-ADDRESSBOOKSERVER-KIND", "FN", "N", "NICKNAME", "ORG", "TEL", "EMAIL",
          "ADR", "CATEGORIES", "X-FAVORITE"}


def head_of(line):
    match = HEAD.match(line)
    return match.group(0) if match else b""


def lines_of(octets):
    """The lines of a stream in UTF-16 or in a character set that keeps ASCII, as octets."""
    start = octets.peek(4)[:4]
    if start.startswith((codecs.BOM_UTF16_LE, codecs.BOM_UTF16_BE)):
        text = io.TextIOWrapper(octets, "utf-16", errors="surrogatepass", newline="")
        lines = (line.encode("utf-8", "surrogatepass") for line in text)
    else:
        lines = octets
    for number, line in enumerate(lines, 1):
        if number == 1 and line.startswith(codecs.BOM_UTF8):
            line = line[len(codecs.BOM_UTF8):]
        for part in line.rstrip(b"\r\n").split(b"\r"):  # the line end of some old programs
            yield number, part


def cards_of(lines):
    """The cards as lists of numbered lines. The list of a card that is cut off by another one or by
    the end of the file, ends with a Refused; a line outside of cards gives a Refused alone."""
    card, depth, outside = [], 0, False
    for number, line in lines:
        word = line.strip().upper()
        if word == b"BEGIN:VCARD":
            nested = depth > 0 and head_of(card[-1][1]).upper().startswith(b"AGENT")
            if depth > 0 and not nested:
                yield card + [(number, Refused(f"the card does not end before line {number}"))]
                card, depth = [], 0
            depth += 1
        elif depth == 0:
            if word and not outside:
                yield [(number, Refused("not within a card"))]
            outside = bool(word)
            continue
        outside = False
        card.append((number, line))
        if word == b"END:VCARD":
            depth -= 1
            if depth == 0:
                yield card
                card = []
    if card:
        yield card + [(number, Refused("the card does not end before the file does"))]


def properties_of(card):
    """The card's own properties, unfolded, as numbered lines."""
    depth = 0
    number, whole = 0, b""
    for next_number, line in [*card, (0, b"END")]:
        head = head_of(whole)
        if QUOTED_PRINTABLE.search(head) and whole.endswith(b"="):
            whole = whole[:-1] + line
        elif line[:1] in (b" ", b"\t"):
            whole += line[1:]
        elif not line.strip() or (BASE64.search(head) and b":" not in line and next_number):
            continue
        else:
            word = whole.strip().upper()
            depth -= word == b"END:VCARD"
            if whole and depth == 1 and word not in (b"BEGIN:VCARD", b"END:VCARD"):
                yield number, whole
            depth += word == b"BEGIN:VCARD"
            number, whole = next_number, line


class CardReader:
    """Reads the properties of one card with vobject."""

    def __init__(self, vobject, charset):
        self.parse = vobject.base.textLineToContentLine
        self.error = vobject.base.VObjectError
        self.split = vobject.vcard.splitFields
        self.texts = vobject.icalendar.stringToTextValues
        self.charset = charset

    def value(self, number, line):
        """The value of a property, with its escapes."""
        head = head_of(line)
        if not head:
            raise Refused("not a property", number)
        try:
            if QUOTED_PRINTABLE.search(head):
                return self.parse(self.with_charset(head, line).decode()).value
            content = self.parse(line.decode("utf-8", "surrogateescape"))
            octets = content.value.encode("utf-8", "surrogateescape")
            if BASE64.search(head):
                octets = base64.b64decode(octets)
            return octets.decode(content.params.get("CHARSET", [self.charset])[0])
        except (UnicodeError, LookupError) as error:
            raise Refused("the text is not in its character set", number) from error
        except (self.error, ValueError) as error:
            raise Refused("not a property", number) from error

    def with_charset(self, head, line):
        """The line as vobject decodes it."""
        name = b"" if b"CHARSET=" in head.upper() else b";CHARSET=" + self.charset.encode()
        plain = QUOTED_PRINTABLE.sub(b"QUOTED-PRINTABLE", head[:-1].rstrip(b"; "))
        return plain + name + b":" + line[len(head):]

    def text(self, value):
        """A text with its escapes decoded; separators that separate nothing stay."""
        return self.texts(escaped(value), listSeparator="\0")[0]

    def list(self, value):
        return self.texts(escaped(value))

    def fields(self, value):
        return [" ".join([field] if isinstance(field, str) else field)
                for field in self.split(escaped(value))]


def escaped(value):
    """The value without an incomplete escape at its end."""
    backslashes = len(value) - len(value.rstrip("\\"))
    return value[:-1] if backslashes % 2 else value


def name_of(reader, value):
    family, given, additional, prefix, suffix = (reader.fields(value) + [""] * 5)[:5]
    return joined_name(prefix, given, additional, family, suffix)


def without_scheme(text):
    """The number of a URI like tel:+86-10;ext=5."""
    return text[4:].split(";")[0] if text.lower().startswith("tel:") else text


def entry_of_card(reader, card):
    found = {name: [] for name in WANTED}
    for number, line in properties_of(card):
        match = HEAD.match(line)
        name = match.group(1).decode().upper() if match else ""
        if not match or name in WANTED:
            found[name or "FN"].append(reader.value(number, line))
    kind = "".join(found["KIND"] + found["X-ADDRESSBOOKSERVER-KIND"]).strip().lower()
    if kind not in ("", "individual", "org"):
        raise Refused(f"a card of a {kind}, not of a contact")
    groups = [group for value in found["CATEGORIES"] for group in reader.list(value)]
    names = [*map(reader.text, found["FN"]), *(name_of(reader, value) for value in found["N"]),
             *map(reader.text, found["NICKNAME"]),
             *(" ".join(reader.fields(value)) for value in found["ORG"])]
    return entry_of(card[0][0], names, uid=reader.text((found["UID"] or [""])[0]),
                    phones=[without_scheme(reader.text(value)) for value in found["TEL"]],
                    mails=map(reader.text, found["EMAIL"]),
                    addresses=[" ".join(reader.fields(value)) for value in found["ADR"]],
                    starred=flag((found["X-FAVORITE"] or [""])[0]),
                    groups=groups if found["CATEGORIES"] else None)


def entries_of_cards(octets, charset):
    try:
        import vobject  # pylint: disable=import-outside-toplevel
        import vobject.vcard  # pylint: disable=import-outside-toplevel,unused-import
        import vobject.icalendar  # pylint: disable=import-outside-toplevel,unused-import
    except ImportError:
        sys.exit(NO_VOBJECT)
    reader = CardReader(vobject, charset)
    for card in cards_of(lines_of(octets)):
        try:
            if isinstance(card[-1][1], Refused):
                raise card[-1][1]
            yield entry_of_card(reader, card)
        except Refused as refused:
            yield {"line": refused.line or card[0][0], "error": str(refused)}
        except Exception as error:  # a failure of vobject costs only this card
            yield {"line": card[0][0], "error": f"the card cannot be read: {error!r}"}


# --- CSV ------------------------------------------------------------------------------------------

# The content of a column by its header, in lower case with single blanks. The first match counts.
COLUMNS = [(meaning, re.compile(pattern)) for meaning, pattern in (
    (None, r".*\b(type|label|display name \d|yomi|phonetic)( .*)?|e-?mail( \d+)? display name"),
    ("uid", r"uid|id|uuid"),
    ("name", r"name|full ?name|display ?name|fn|file as|姓名|名称|联系人|名字"),
    ("given", r"given ?name|first ?name|given|first|名"),
    ("family", r"family ?name|last ?name|surname|family|last|姓|姓氏"),
    ("additional", r"additional name|middle ?name"),
    ("prefix", r"name prefix|prefix|title"),
    ("suffix", r"name suffix|suffix"),
    ("nickname", r"nick ?name|昵称"),
    ("organization", r"organi[sz]ation( \d+)?( - |)( ?name)?|company|公司|单位"),
    ("phones", r"(.* )?(tele)?phone( \d+)?( number| - value)?|mobile( number)?|cell|tel|telephone"
               r"|(手机|电话|移动电话|住宅电话|商务电话)(号码)?\d*"),
    ("mails", r"e-?mail( address)?|e-?mail \d+( address| - value)|(home|work) e-?mail"
              r"|邮箱|邮件|电子邮件(地址)?|电邮"),
    ("addresses", r"address|addresses|(.* )?(street|postal) ?(address)?( \d+)?|address \d+ - "
                  r"(formatted|street|city|country)|(home|business|other|work) address|地址|住址"),
    ("groups", r"group membership|groups?|labels|categor(y|ies)|分组|群组"),
    ("starred", r"starred|favou?rites?|收藏"),
)]
LABELS = "labels"


def columns_of(header):
    """The meaning of each column, None for one that is ignored."""
    meanings = []
    for title in header:
        title = tidy(title).lower()
        fitting = [meaning for meaning, pattern in COLUMNS if pattern.fullmatch(title)]
        if title == LABELS:
            fitting = ["groups"]
        meanings.append(fitting[0] if fitting else None)
    return meanings


def entry_of_row(line, meanings, row):
    if any(cell.strip() for cell in row[len(meanings):]):
        raise Refused(f"{len(row)} fields under a header of {len(meanings)}")
    cells = {meaning: [] for meaning, _ in COLUMNS}
    for meaning, cell in zip(meanings, row):
        cells[meaning].append(cell)

    def first(meaning):
        return next((cell for cell in cells[meaning] if cell.strip()), "")

    groups = [group for cell in cells["groups"] for group in re.split(r":::|;", cell)]
    parts = map(first, ("prefix", "given", "additional", "family", "suffix"))
    return entry_of(line, [first("name"), joined_name(*parts), first("nickname"),
                           first("organization")],
                    uid=first("uid"), mails=cells["mails"], addresses=cells["addresses"],
                    phones=[phone for cell in cells["phones"] for phone in cell.split(":::")],
                    starred=flag(first("starred")),
                    groups=groups if first("groups") else None)


class Rows:
    """The rows of a file with the line where each begins."""

    def __init__(self, octets, charset):
        self.octets, self.charset = octets, charset
        self.number, self.bad = 0, False

    def text(self):
        for self.number, line in lines_of(self.octets):
            try:
                yield decoded(line, self.charset) + "\n"
            except Refused:
                self.bad = True  # the row is refused when it is complete
                yield line.decode("ascii", "replace") + "\n"

    def rows(self):
        lines = self.text()
        first = next(lines, "")
        delimiter = max(",;\t", key=first.count)
        reader = csv.reader(self.chain(first, lines), delimiter=delimiter, strict=True)
        begin = 1
        while True:
            try:
                row = next(reader, None)
                if row is None:
                    return
                error = f"the text is not in {self.charset}" if self.bad else ""
            except csv.Error as failure:
                row, error = [], f"not a row of fields: {failure}"
            if row or error:
                yield begin, row, error
            begin, self.bad = self.number + 1, False

    @staticmethod
    def chain(first, lines):
        yield first
        yield from lines


def entries_of_rows(octets, charset):
    csv.field_size_limit(sys.maxsize)
    meanings = None
    for line, row, error in Rows(octets, charset).rows():
        try:
            if error:
                raise Refused(error)
            if meanings is not None:
                yield entry_of_row(line, meanings, row)
                continue
            meanings = columns_of(row)
            if not {"name", "given", "family"} & set(meanings):
                raise Refused("the header has no column with a name, like Name or First Name")
        except Refused as refused:
            yield {"line": line, "error": str(refused)}
            if not meanings or not {"name", "given", "family"} & set(meanings):
                return


def main():
    signal.signal(signal.SIGINT, signal.SIG_DFL)
    signal.signal(signal.SIGPIPE, signal.SIG_DFL)
    kind, charset = sys.argv[1:3]
    entries = {"vcard": entries_of_cards, "csv": entries_of_rows}[kind]
    for entry in entries(sys.stdin.buffer, charset):
        print(json.dumps(entry))


if __name__ == "__main__":
    main()
