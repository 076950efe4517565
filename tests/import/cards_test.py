"""How vCards and CSV become contacts: cards_test.py TOOL PYFILE CONVERTER"""
from importing import ALL, PARTLY, ImportTest, main, skip_without

skip_without("vobject")

NOT_CLOSED = "the card does not end before "
CHARSET = "the text is not in its character set"


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
        self.assertEqual({1: "not within a card", 8: NOT_CLOSED + "line 11", 14: "not a property",
                          18: CHARSET, 22: CHARSET, 26: CHARSET,
                          28: "no name, mail address or phone number",
                          32: "a card of a group, not of a contact",
                          41: NOT_CLOSED + "the file does"}, refused)
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


if __name__ == "__main__":
    main()
