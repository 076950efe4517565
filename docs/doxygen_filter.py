"""Shows Doxygen the comments of a header, which are plain // comments:

- the comment before a declaration, or before a group of declarations without a blank line between
  them, becomes the documentation of each;
- the comment behind a declaration becomes its documentation, and so does the comment above a blank
  line at the top of the file for the file;
- deleted members are no interface and left out, assertions too.

doxygen_filter.py HEADER
"""
import re
import sys

ESCAPED = re.compile(r"[\\@<>#%&$]")
TRAILING = re.compile(r"^(.*\S)\s*//\s?(.*)$")
# Lines that open or close a scope or switch access, and those that are no declarations.
TYPE = re.compile(r"\s*(typedef )?(class|struct|enum)\b")
NEUTRAL = re.compile(r"^\s*(#|[{}]|public:|protected:|private:|extern \"C\"$|template\b|namespace\b"
                     r"|class \w+;|struct \w+;|friend\b)")


def escape(text):
    return ESCAPED.sub(lambda match: "\\" + match.group(0), text)


def statements(lines):
    """Yields (kind, lines): comment, blank, neutral or declaration, which may take several lines.

    A definition of a class counts as the declaration of its first line; its body follows.
    """
    pending = []
    depth = 0
    for line in lines:
        code = line.split("//")[0].rstrip()
        if not pending:
            if line.strip().startswith("//"):
                yield "comment", [line]
                continue
            if not line.strip():
                yield "blank", [line]
                continue
            if NEUTRAL.match(line):
                yield "neutral", [line]
                continue
        pending.append(line)
        depth += code.count("(") - code.count(")")
        opens_type = TYPE.match(pending[0])
        in_body = "{" in "".join(pending) and not opens_type
        if in_body:
            braces = "".join(l.split("//")[0] for l in pending)
            done = braces.count("{") == braces.count("}") and code.endswith(("}", ";", "},"))
        else:
            done = depth == 0 and (code.endswith((";", ",")) or opens_type)
        done = done or (depth == 0 and re.match(r"^\s*[A-Z_0-9]+( = \S+)?$", code) is not None)
        if done:
            yield "declaration", pending
            pending, depth = [], 0
    if pending:
        yield "declaration", pending


def documented(declaration, comment):
    """The declaration with its documentation."""
    behind = []
    code = []
    for line in declaration:
        match = TRAILING.match(line)
        if match:
            behind.append(match.group(2))
            line = match.group(1)
        code.append(line)
    text = [re.sub(r"^\s*//\s?", "", line) for line in comment] + behind
    return [f"/// {escape(line)}" for line in text] + code


def filtered(lines):
    out = ["/// @file"]
    comment = []        # documents what follows until a blank line
    collecting = False  # whether the comment is still growing
    at_top = True       # before the first declaration
    for kind, block in statements(lines):
        if kind == "comment":
            comment = comment + block if collecting else list(block)
            collecting = True
            continue
        collecting = False
        if kind == "blank":
            if at_top and comment:
                out[0:1] = ["/// @file"] + documented([], comment)
            comment = []
            out += block
        elif kind == "neutral":
            if block[0].startswith("#define") and (comment or TRAILING.match(block[0])):
                block = documented(block, comment)
            if not block[0].lstrip().startswith(("#", "template")):
                comment = []  # another scope, or another access
            out += block
        elif "= delete" in block[-1] or block[0].lstrip().startswith("static_assert"):
            continue
        else:
            at_top = False
            out += documented(block, comment)
            if TYPE.match(block[0]):
                comment = []
    return out


def main():
    with open(sys.argv[1], encoding="utf-8") as header:
        print("\n".join(filtered(header.read().splitlines())))


main()
