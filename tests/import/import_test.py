"""What an import does to a database and its index, and how vCards and CSV become contacts.

import_test.py TOOL PYFILE [TestClass...]
"""
import contextlib
import json
import os
import pathlib
import pty
import quopri
import re
import sqlite3
import subprocess
import sys
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).parents[1] / "Support"))
# pylint: disable=wrong-import-position
from tool_case import DONE, FAILED, MISSING, PARTLY, PYFILE, SKIPPED, USAGE, ToolCase

ALL = "contacts JOIN localizer ON contact_id = _id"
STATE = ("_id, display_name, localizerkey, group_id, account_id, hasMail, hasAddress, starred, "
         "has_phone_number, times_contacted, last_time_contacted, single_is_secret, "
         "status_update_id")


class ImportTest(ToolCase):
    WITH_SAMPLE = False

    def file(self, name, content):
        path = self.root / name
        path.write_bytes(content if isinstance(content, bytes) else content.encode())
        return path

    def bring(self, path, *arguments, code=DONE, **options):
        """Imports the file: how many were added, updated, unchanged and refused, and what was
        refused by line."""
        process = self.run_tool("import", path, "--pyfile", PYFILE, *arguments, code=code,
                                **options)
        shown = "standard input" if path == "-" else str(path)
        counts = process.stdout.split(f"{shown}: ")[1].split("\n")[0]
        numbers = [int(word) for word in counts.split() if word.isdigit()]
        refused = re.findall(rf"(?m)^{re.escape(shown)}:(\d+): refused: (.*)$", process.stderr)
        self.assertEqual(numbers[3], len(refused), process.stderr)
        self.assertNotIn("\r", process.stderr, "a bar in a pipe")
        return numbers, {int(line): reason for line, reason in refused}

    def bring_lines(self, *entries, **options):
        text = "".join(json.dumps(entry) + "\n" for entry in entries)
        return self.bring(self.file("entries.jsonl", text), **options)

    def groups(self):
        return dict(self.sql("SELECT name, group_id FROM qv_imported_groups"))


class IntoNothingTest(ImportTest):
    def test_database_and_index_are_made(self):
        counts, refused = self.bring_lines(
            {"name": " 张三 ", "uid": "u1", "phones": ["1"], "groups": ["Family", "Work"]},
            {"name": "Zoë", "mails": ["z@e"], "addresses": [" "], "starred": True},
            {"name": "\U0001f600", "addresses": ["Main St"], "groups": ["Work"]})
        self.assertEqual(([3, 0, 0, 0], {}), (counts, refused))
        rows = self.sql(f"SELECT display_name, has_phone_number, hasMail, hasAddress, starred,"
                        f" group_id FROM {ALL} WHERE _id IN (SELECT _id FROM visible_contacts)")
        self.assertEqual([("张三", 1, 0, 0, 0, "1.2"), ("Zoë", 0, 1, 0, 1, ""),
                          ("\U0001f600", 0, 0, 1, 0, "2")], rows)
        self.assertEqual({"Family": 1, "Work": 2}, self.groups())
        self.assertEqual({1}, self.found("zhangsan", "--group", "1", "--phone"))
        self.assertEqual({1, 3}, self.found("", "--group", "2"))
        self.assertEqual({"contacts2.db"}, {path.name for path in self.database.parent.iterdir()})

    def test_nothing_is_made_of_nothing(self):
        self.assertEqual([0, 0, 0, 0], self.bring_lines()[0])
        self.assertEqual([0, 0, 0, 1], self.bring_lines({}, code=PARTLY)[0])
        self.assertEqual([], list(self.database.parent.iterdir()))

    def test_what_cannot_be_taken_is_told_by_line(self):
        text = b'\xef\xbb\xbf{"name": "One"}\n\nname: Two\n["Three"]\n{"name": " "}\n' \
               b'{"name": "Fi\xffve"}\n{"name": 6}\n{"name": "7", "phones": "7"}\n' \
               b'{"name": "8", "starred": 1}\n{"name": "9\\u0000"}\n' \
               b'{"line": 70, "error": "bad\\u001b[1m"}\n{"name": "Ten", "uid": null, "x": 1}'
        counts, refused = self.bring(self.file("a.jsonl", text), code=PARTLY)
        self.assertEqual([2, 0, 0, 9], counts)
        self.assertEqual({3: "not JSON in UTF-8", 4: "not a JSON object", 5: "no name",
                          6: "not JSON in UTF-8", 7: '"name" is no text', 8: '"phones" is no list',
                          9: '"starred" is neither true nor false',
                          10: '"name" holds a zero character', 70: r"bad\x1b[1m"}, refused)
        self.assertEqual([("One",), ("Ten",)], self.sql("SELECT display_name FROM localizer"))

    def test_standard_input_and_formats(self):
        line = b'{"name": "One"}\n'
        self.assertEqual([1, 0, 0, 0], self.bring("-", input=line)[0])
        self.assertEqual([0, 0, 1, 0], self.bring(self.file("no_end", line))[0])
        self.assertEqual([1, 0, 0, 0], self.bring(self.file("b.csv", "Name\nTwo\n"))[0])
        self.assertEqual([0, 0, 1, 0], self.bring("-", input=b"Name,X\nTwo,y\n")[0])
        self.bring(self.file("c.csv", line), code=PARTLY)
        self.bring(self.file("c.csv", line), "--format", "jsonl")


class IntoSampleTest(ImportTest):
    WITH_SAMPLE = True

    def state(self):
        return {row[0]: list(row) for row in self.sql(f"SELECT {STATE} FROM {ALL}")}

    def test_adds_updates_and_leaves_the_rest(self):
        expected = self.state()
        first, = self.sql("SELECT min(_id) FROM visible_contacts JOIN localizer ON _id = contact_id"
                          " WHERE display_name = '张三'")[0]
        new = 1 + max(expected)
        counts, _ = self.bring_lines(
            {"name": "张三", "uid": "u1", "phones": [], "groups": ["Family"]},
            {"name": "阿不思", "uid": "u2", "mails": ["a@b"]})
        self.assertEqual([1, 1, 0, 0], counts)
        state = self.state()
        state.pop(new)
        groups = expected[first][3]
        expected[first][3] = ".".join(filter(None, [groups, "7"]))  # after the sample's six groups
        expected[first][8] = 0
        self.assertEqual(expected, state)
        self.assertEqual({new}, self.found("abusi"))
        self.assertIn(first, self.found("zs", "--group", "7"))

        counts, _ = self.bring_lines({"name": "章四", "uid": "u1", "groups": []},
                                     {"name": "阿不思", "starred": True}, {"name": "阿不思"})
        self.assertEqual([1, 2, 0, 0], counts)
        self.assertIn(first, self.found("zhangsi"))
        self.assertNotIn(first, self.found("zhangsan"))
        self.assertEqual({new}, self.found("abusi", "--starred"))
        self.assertEqual({new, new + 1}, self.found("abusi"))
        self.assertEqual(groups, self.state()[first][3])

    def test_the_same_again_changes_nothing(self):
        entries = [{"name": "王五", "uid": f"u{i % 7}" if i % 2 else None, "groups": [f"g{i % 3}"]}
                   for i in range(30)]
        self.bring_lines(*entries)
        before = self.state(), self.groups(), self.found("")
        counts, _ = self.bring_lines(*entries)
        self.assertEqual(0, counts[0])
        once = [entry for i, entry in enumerate(entries) if not i % 2]  # each uid stands twice
        self.assertEqual([0, 0, 15, 0], self.bring_lines(*once)[0])
        self.assertEqual(before, (self.state(), self.groups(), self.found("")))

    def test_more_than_the_index_is_patched_with(self):
        everybody = self.found("")
        entries = [{"name": f"王{i}", "phones": ["1"]} for i in range(1200)]
        self.assertEqual([1200, 0, 0, 0], self.bring_lines(*entries)[0])
        self.assertEqual(len(everybody) + 1200, len(self.found("")))
        self.assertEqual([0, 0, 1200, 0], self.bring_lines(*entries)[0])

    def test_a_deleted_contact_comes_back_under_a_new_id(self):
        self.bring_lines({"name": "Gone", "uid": "u"})
        (gone,), = self.sql("SELECT contact_id FROM localizer WHERE display_name = 'Gone'")
        for table, column in (("contacts", "_id"), ("visible_contacts", "_id"),
                              ("localizer", "contact_id")):
            self.sql(f"DELETE FROM {table} WHERE {column} = {gone}")
        self.assertEqual([1, 0, 0, 0], self.bring_lines({"name": "Gone", "uid": "u"})[0])
        self.assertEqual([(gone + 1,)], self.sql("SELECT contact_id FROM qv_imported_uids"))

    def test_a_converter_that_fails_and_a_busy_database_change_nothing(self):
        converter = self.file("broken.py", 'print(\'{"name": "New"}\', flush=True)\nraise SystemExit(1)')
        before = self.database.read_bytes()
        self.refused(FAILED, "Nothing was imported", "import", self.file("a.vcf", ""),
                     "--converter", converter)
        path = self.file("a.jsonl", '{"name": "New"}\n')
        with contextlib.closing(sqlite3.connect(self.database)) as database:
            database.execute("BEGIN IMMEDIATE")
            self.refused(FAILED, "database is locked", "import", path)
        self.assertEqual(before, self.database.read_bytes())
        self.assertEqual([1, 0, 0, 0], self.bring(path)[0])


class ErrorsTest(ImportTest):
    def test_says_what_is_missing(self):
        (self.root / "vobject.py").write_text("raise ImportError")
        environment = {**os.environ, "PYTHONPATH": str(self.root)}
        empty, card_file = self.file("a.csv", ""), self.file("a.vcf", "")
        for code, text, *call in (
                (MISSING, "none.vcf: No such file", self.root / "none.vcf"),
                (FAILED, "Is a directory", self.root), (USAGE, "--format", empty, "--format", "odt"),
                (MISSING, "--converter", empty, "--converter", "none.py"),
                (MISSING, "apt install python3-vobject", card_file, "--pyfile", PYFILE)):
            self.refused(code, text, "import", *call, env=environment)
            self.assertFalse(self.database.exists())

    def test_shows_a_bar_on_a_terminal_and_takes_it_away(self):
        gate = self.root / "gate"  # until it is open the converter waits
        os.mkfifo(gate)
        converter = self.file("waits.py", f'print(\'{{"name": "One"}}\', flush=True)\n'
                                          f'open("{gate}").read()\n')
        terminal, other_end = pty.openpty()
        self.addCleanup(os.close, terminal)
        process = subprocess.Popen(
            self.call("import", self.file("a.vcf", "x" * 100), "--pyfile", PYFILE, "--converter",
                      converter), stdout=subprocess.PIPE, stderr=other_end)
        self.addCleanup(process.wait)
        shown = ""
        while "%" not in shown:
            shown += os.read(terminal, 1000).decode()
        gate.write_text("")
        self.assertRegex(shown, r"\rImporting contacts +\[[#.]{30}\] +\d+%")
        self.assertIn(b"1 added", process.communicate()[0])
        os.write(other_end, b"$")
        while "$" not in shown:
            shown += os.read(terminal, 1000).decode()
        os.close(other_end)
        self.assertRegex(shown, r"%\r +\r\$$")


def card(*properties, version="3.0", end="\r\n"):
    lines = ["BEGIN:VCARD", f"VERSION:{version}", *properties, "END:VCARD"]
    return b"".join((line if isinstance(line, bytes) else line.encode()) + end.encode()
                    for line in lines)


def quoted(text, charset):
    return "".join(f"={octet:02X}" for octet in text.encode(charset))


class CardsTest(ImportTest):
    FLAGS = "has_phone_number || hasMail || hasAddress || starred"

    def rows(self):
        return self.sql(f"SELECT display_name, {self.FLAGS} FROM {ALL} ORDER BY _id")

    def test_every_version_and_its_encodings(self):
        xiaoming, wang = quoted("小明", "gbk"), quoted("王", "gbk")
        cards = [  # a card; the name, and whether it has phone, mail, address and star
            (card("FN:张三", "N:错;误;;;", "TEL:1"), "张三", "1000"),
            (card(b"FN:\xe5\xbc", b" \xa0\xe4\xb8", b"\t\x89", "item1.EMAIL;type=HOME:a@b"),
             "张三", "0100"),
            (card("N:Smith;John;Q.,R.;Dr.;Jr.", "ADR;TYPE=HOME:;;Main St 1;Town;;;"),
             "Dr. John Q. R. Smith Jr.", "0010"),
            (card("N:欧阳;修;;;", "ADR:;;;;;;", "TEL:"), "欧阳修", "0000"),
            (card("N:Lee;小龙 Bruce;;;"), "Lee小龙 Bruce".replace("Lee", "Lee "), "0000"),
            (card(r"FN:Smith\, John\; Jr\n", "X-FAVORITE:1"), "Smith, John; Jr", "0001"),
            (card("FN:Smith, John"), "Smith, John", "0000"),
            (card("FN:back\\"), "back", "0000"),
            (card("FN:", "N:;;;;", "ORG:ACME;Sales"), "ACME Sales", "0000"),
            (card("TEL:+1 555"), "+1 555", "1000"),
            (card(f"N;CHARSET=GBK;ENCODING=QUOTED-PRINTABLE:{wang};=", f"{xiaoming[:9]}=",
                  f"{xiaoming[9:]};;;", "TEL;CELL;VOICE:5", "PHOTO;JPEG;BASE64:", "AAAA",
                  "BBBB==", "", version="2.1"), "王小明", "1000"),
            (card(f"FN;quoted-printable:{quoted('Zoë', 'utf-8')}=20=", "Ray", version="2.1"),
             "Zoë Ray", "0000"),
            (card(b"N;CHARSET=GBK:" + "李;四".encode("gbk"), version="2.1", end="\n"), "李四", "0000"),
            (card("FN:Agent", "AGENT:", "BEGIN:VCARD", "FN:Other", "TEL:7", "END:VCARD",
                  version="2.1"), "Agent", "0000"),
            (card("KIND:individual", "FN;ALTID=1;LANGUAGE=zh:刘洋", "FN;ALTID=1;LANGUAGE=en:Yang",
                  'TEL;VALUE=uri;TYPE="voice,home":tel:+86-10;ext=5', version="4.0"),
             "刘洋", "1000"),
            (card("fn:lower", "CATEGORIES:starred,myContacts", "UNKNOWN:x\0y"), "lower", "0001"),
            (card("FN;ENCODING=b:5byg5LiJ"), "张三", "0000"),
        ]
        counts, _ = self.bring(self.file("a.vcf", b"".join(text for text, _, _ in cards)))
        self.assertEqual([len(cards), 0, 0, 0], counts)
        self.assertEqual([expected[1:] for expected in cards], self.rows())

    def test_what_is_broken_is_told_and_costs_no_other_card(self):
        text = b"".join((
            b"what\nis\nthis\n", card("FN:One", end="\n"),           # lines 1 to 7
            card("FN:Cut", end="\n")[:-10],                          # 8 to 10
            card("FN:" + "x" * 20, "TEL;a," + "=" * 60, end="\n"),   # 11 to 15
            card(b"FN:\xc0\xee", end="\n"),                          # 16 to 19
            card("FN;CHARSET=none:x", end="\n"),                     # 20 to 23
            card("FN;ENCODING=QUOTED-PRINTABLE:=C0=EE", end="\n"),   # 24 to 27
            card("NOTE:nobody", end="\n"), card("KIND:group", "FN:G", end="\n"),  # 28 to 36
            card("FN:Two", end="\n"), b"BEGIN:VCARD\nFN:Last\n"))    # 37 to 42
        counts, refused = self.bring(self.file("b.vcf", text), code=PARTLY)
        self.assertEqual([2, 0, 0, 9], counts)
        self.assertEqual({1: "not within a card", 8: "the card does not end before line 11", 14: "not a property",
                          **dict.fromkeys((18, 22, 26), "the text is not in its character set"),
                          28: "no name, mail address or phone number",
                          32: "a card of a group, not of a contact",
                          41: "the card does not end before the file does"}, refused)
        self.assertEqual([("One", "0000"), ("Two", "0000")], self.rows())

    def test_character_sets_of_files(self):
        text = card("FN:张三").decode()
        self.bring(self.file("gbk.vcf", text.encode("gbk")), code=PARTLY)
        self.bring(self.file("gbk.vcf", text.encode("gbk")), "--charset", "gb18030")
        self.bring(self.file("mark.vcf", "\ufeff" + text))
        self.bring(self.file("utf16.vcf", text.encode("utf-16")), "--format", "vcard")
        self.assertEqual([("张三", "0000")], self.rows())

    def test_tables_as_others_write_them(self):
        tables = [
            ("First Name,Middle Name,Last Name,Phonetic First Name,Labels,E-mail 1 - Label,"
             "E-mail 1 - Value,Phone 1 - Label,Phone 1 - Value,Address 1 - Formatted\n"
             "三,,张,x,* myContacts ::: Family ::: * starred,,a@b,Mobile,123 ::: 456,"
             "\"Line 1\nLine 2\"\nAnna,M.,Lee,,,Home,,Mobile,,\n",
             [("张三", "1111"), ("Anna M. Lee", "0000")], {}),
            ("Title;First Name;Last Name;E-mail Address;E-mail Display Name;Home Street;"
             "Mobile Phone;Categories\nDr.;John;Smith;;x;;1;Work;extra\n"
             ";Jo;Sm;;q;5 Road;;Work;;\n;\"bad\"x;;;;;;\n;Yi;Er;q@r;;;;\n",
             [("Jo Sm", "0010"), ("Yi Er", "0100")],
             {2: "9 fields under a header of 8",
              4: "not a row of fields: ';' expected after '\"'"}),
            ("姓名\t手机\t收藏\r\n王五\t138\t是\r\n\r\n李六\t\t\r\n", [("王五", "1001"), ("李六", "0000")],
             {}),
            ("Phone,Address\n1,2\n", [],
             {1: "the header has no column with a name, like Name or First Name"}),
        ]
        taken = []
        for text, rows, expected in tables:
            taken += rows
            counts, refused = self.bring(self.file("a.csv", text), code=PARTLY if expected else 0)
            self.assertEqual(([len(rows), 0, 0, len(expected)], expected), (counts, refused))
            self.assertEqual(taken, self.rows())
        self.assertEqual({"Family", "Work"}, set(self.groups()))


CARDS = 200
FAMILIES = ("张", "歐陽", "李", "Smith", "O'Brien", "Müller", "曾", "Ng", "单于", "Díaz")
GIVEN = ("三", "国庆", "John", "小 红", "Anna-Lena", "Zoë", "樂天", "María José")


def write(contact, number):
    """Makes the contact of the peer's own library one that is written in many ways."""
    family, given = FAMILIES[number % len(FAMILIES)], GIVEN[number // 3 % len(GIVEN)]
    long = f" {family} der Lange" * 9 if number % 7 == 0 else ""
    comma = ", Jr" if number % 11 == 0 else ""
    for name, value in (("full-name", f"{given} {family}{number}{long}{comma}"),
                        ("id", f"uid-{number}"),
                        ("mobile-phone", f"+86 138 {number}" if number % 2 else None),
                        ("email-1", None if number % 3 else f"person{number}@example.org"),
                        ("categories", None if number % 5 else
                         "Family,Ärzte" if number % 10 else "Work")):
        if value:
            contact.set_property(name, value)


def with_quoted_names(card, charset):
    """The card with its names in quoted-printable, folded by soft breaks."""
    lines = []
    for line in card.replace("\r\n ", "").split("\r\n"):
        name, _, value = line.partition(":")
        if name in ("FN", "N"):
            octets = quopri.encodestring(value.encode(charset), quotetabs=True)
            name += f";CHARSET={charset.upper()};ENCODING=QUOTED-PRINTABLE"
            value = octets.decode().replace("\n", "\r\n")
        lines.append(f"{name}:{value}" if name else "")
    return "\r\n".join(lines).replace("VERSION:3.0", "VERSION:2.1")


def broken(card, number):
    old, new = (("END:VCARD", ""), ("FN", "no property of a card\r\nFN"),
                ("FN", "FN;CHARSET=UTF-8;ENCODING=QUOTED-PRINTABLE:=C0=EE\r\nX-FN"))[number % 3]
    return card.replace(old, new)


class PeerTest(ImportTest):
    """Cards that another address book writes are imported as it reads them itself, here
    Evolution's library for vCards."""

    def test_both_read_the_same(self):
        peer = evolution()
        version_21, version_30 = (peer.VCardFormat(number) for number in (0, 1))
        cards, intact = [], {}
        for number in range(CARDS):
            contact = peer.Contact.new()
            write(contact, number)
            original = contact.to_string(version_21 if number % 4 == 1 else version_30)
            card = original = original.rstrip("\r\n") + "\r\n"
            if number % 6 == 5:  # which the peer does not read whole where a name takes many lines
                card = with_quoted_names(card, "gb18030" if number % 4 == 3 else "utf-8")
            if number % 20 == 19:
                card = broken(card, number // 20)
            else:
                intact[f"uid-{number}"] = original
            cards.append(card)
        text = "".join(cards)
        self.assertRegex(text, "\r\n [^$]*=\r\n")
        counts, _ = self.bring(self.file("cards.vcf", text), code=PARTLY)
        self.assertEqual([len(intact), 0, 0, CARDS - len(intact)], counts)

        rows = self.sql(f"SELECT uid, display_name, has_phone_number, hasMail, group_id FROM {ALL}"
                        " JOIN qv_imported_uids USING (contact_id)")
        self.assertEqual(len(intact), len(rows))
        names = {str(group): name for name, group in self.groups().items()}
        for uid, *found, groups in rows:
            read = peer.Contact.new_from_vcard(intact[uid]).get_property
            self.assertEqual([" ".join(read("full-name").split()), bool(read("mobile-phone")),
                              bool(read("email-1"))], found, intact[uid])
            self.assertEqual((read("categories") or "").split(","),
                             [names.get(group, "") for group in groups.split(".")])


def evolution():
    import gi  # pylint: disable=import-outside-toplevel
    gi.require_version("EBookContacts", "1.2")
    from gi.repository import EBookContacts  # pylint: disable=import-outside-toplevel
    return EBookContacts


if __name__ == "__main__":
    try:
        if {"CardsTest", "PeerTest"} & set(sys.argv):
            import vobject  # pylint: disable=unused-import
        if "PeerTest" in sys.argv:
            evolution()
    except (ValueError, ImportError) as missing:
        print("skipped:", missing)
        sys.exit(SKIPPED)
    unittest.main(argv=[sys.argv[0], *sys.argv[3:]])
