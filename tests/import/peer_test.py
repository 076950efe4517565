"""Cards that another address book writes are imported as it reads them itself, here Evolution's
library for vCards: peer_test.py TOOL PYFILE CONVERTER"""
import quopri

from importing import ALL, PARTLY, ImportTest, main, skip_without

skip_without("vobject", "gi")
import gi  # pylint: disable=wrong-import-position

try:
    gi.require_version("EBookContacts", "1.2")
    from gi.repository import EBookContacts
except (ValueError, ImportError):
    skip_without("gi.repository.EBookContacts")

CARDS = 200
VERSION_21, VERSION_30 = (EBookContacts.VCardFormat(number) for number in (0, 1))
FAMILIES = ("张", "歐陽", "李", "Smith", "O'Brien", "Müller", "曾", "Ng", "单于", "Díaz")
GIVEN = ("三", "国庆", "John", "小 红", "Anna-Lena", "Zoë", "樂天", "María José")


def written(number):
    """A card of the peer's own hand."""
    contact = EBookContacts.Contact.new()
    family, given = FAMILIES[number % len(FAMILIES)], GIVEN[number // 3 % len(GIVEN)]
    name = EBookContacts.ContactName()
    name.family, name.given = family, given
    contact.set_property("name", name)
    long = f" {family} der Lange" * 9 if number % 7 == 0 else ""
    comma = ", Jr" if number % 11 == 0 else ""
    contact.set_property("full-name", f"{given} {family}{number}{long}{comma}")
    contact.set_property("id", f"uid-{number}")
    if number % 2:
        contact.set_property("mobile-phone", f"+86 138 {number}")
    if number % 3 == 0:
        contact.set_property("email-1", f"person{number}@example.org")
    if number % 5 == 0:
        contact.set_property("categories", "Family,Ärzte" if number % 10 else "Work")
    return contact.to_string(VERSION_21 if number % 4 == 1 else VERSION_30)


def quoted(card, charset):
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
    if number % 3 == 0:
        return card.replace("END:VCARD", "")
    if number % 3 == 1:
        return card.replace("FN", "no property of a card\r\nFN")
    return card.replace("FN", "FN;CHARSET=UTF-8;ENCODING=QUOTED-PRINTABLE:=C0=EE\r\nX-FN")


class PeerTest(ImportTest):
    def test_both_read_the_same(self):
        cards, intact = [], {}
        for number in range(CARDS):
            original = card = written(number).rstrip("\r\n") + "\r\n"
            if number % 6 == 5:  # which the peer does not read whole where a name takes many lines
                card = quoted(card, "gb18030" if number % 4 == 3 else "utf-8")
            if number % 20 == 19:
                card = broken(card, number // 20)
            else:
                intact[f"uid-{number}"] = original
            cards.append(card)
        self.assertTrue(any("\r\n " in card for card in cards))
        self.assertTrue(any("=\r\n" in card for card in cards))
        counts, _ = self.bring(self.file("cards.vcf", "".join(cards)), code=PARTLY)
        self.assertEqual([len(intact), 0, 0, CARDS - len(intact)], counts)

        rows = self.sql(f"SELECT uid, display_name, has_phone_number, hasMail, group_id FROM {ALL}"
                        " JOIN qv_imported_uids USING (contact_id)")
        self.assertEqual(len(intact), len(rows))
        names = {str(group): name for name, group in self.groups().items()}
        for uid, name, phone, mail, groups in rows:
            read = EBookContacts.Contact.new_from_vcard(intact[uid])
            categories = read.get_property("categories") or ""
            self.assertEqual(
                (" ".join(read.get_property("full-name").split()),
                 bool(read.get_property("mobile-phone")), bool(read.get_property("email-1")),
                 set(filter(None, categories.split(",")))),
                (name, bool(phone), bool(mail),
                 {names[group] for group in groups.split(".") if group}), intact[uid])


if __name__ == "__main__":
    main()
