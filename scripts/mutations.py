"""The small changes that scripts/mutants tries on a file, one at a time."""
import itertools, re
from typing import NamedTuple

OPERATORS = {"<": "<=", "<=": "<", ">": ">=", ">=": ">", "==": "!=", "!=": "==", "&&": "||",
             "||": "&&", "+": "-", "-": "+", "*": "/", "/": "*", "+=": "-=", "-=": "+=",
             "++": "--", "--": "++", "true": "false", "false": "true"}
KINDS = {"boundary": "< <= > >=", "equality": "== !=", "logic": "&& ||", "boolean": "true false",
         "arithmetic": "+ - * / += -= ++ --"}
KIND_OF = {token: kind for kind, tokens in KINDS.items() for token in tokens.split()}
TOKEN = re.compile(r"(?<= )(?:[<>=!]=|[-+]=|&&|\|\||[-+*/<>])(?= )|\+\+|--|\btrue\b|\bfalse\b"
                   r"|(?<![\w.])(?:0x[0-9A-F]+|\d+)")
DECLARATION = re.compile(r"((const|constexpr|static) )*[\w:]+(<.*>)?[*&]?( const)? \w+( =|[;({])")
LITERAL = r"\"(\\.|[^\"\\])*\"|(?<!\w)'(\\.|[^'\\\n])+'"  # not the ' between digits
BARE = re.compile(r"(const )?[\w:]+(<.*>)? \w+;$")  # a declaration that reads nothing
LIMITS = re.compile(r"if \(\w+ [<>]=? (?:static_cast<double>\((.+)\)|(.+))\) return (?:\1|\2);$")  # at it, both ways give it
LEAVES = re.compile(r"(return|break|continue|throw)\b")
SYMMETRIC = re.compile(r"\bstd::(min|max|hypot)$")  # the same with its arguments exchanged, but for no numbers
# What is not changed: attributes and what only the compiler reads, room to spare, what only saves time.
PLAIN = (r"^ *(#|static_assert|virtual).*|\[\[.*?\]\]|\bchar \w+\[\w+\];|\S*\.reserve\(.*\);")


class tMutant(NamedTuple):
    path: str
    line: int      # first line that differs
    place: str     # the function that it is in, or the name that is declared there
    kind: str
    before: str
    after: str
    text: str      # the whole file, without comments, of the same lines


def blanked(pattern, text):
    """The text without what matches, of the same length and lines."""
    return re.sub(pattern, lambda match: re.sub(r"[^\n]", " ", match[0]), text, flags=re.M)


def replacement(token):
    if token in OPERATORS: return OPERATORS[token]
    if token.startswith("0x"): return f"0x{int(token, 16) + 1:X}"
    return str(int(token) + 1)


def independent(one, two):
    """Whether `one` is a plain assignment that `two` cannot see, so that their order is the same."""
    name = r"\b[a-z]\w*" if "(" in two else r"\b[a-z]\w*(?:(?:->|\.)\w+)*"  # a call may see all of an object
    names = [set(re.findall(name, part)) - {"const", "char", "double", "nullptr", "if", "return"}
             for part in (one, two)]
    return re.match(r"(?!.*(\+\+|--))[^()]*\w = [^()]*;$", one) and not names[0] & names[1] \
        and (DECLARATION.match(one) or "(" not in two)


def feeds(one, two):
    """Whether `one` assigns what `two` names."""
    assigned = re.match(r"(?:\+\+|--)?([\w.\->]+)(?: [-+*/]?= .*)?;$", one)
    return assigned and re.search(rf"(?<![\w.>]){re.escape(assigned[1])}\b", two)


class Outline:
    """The simple statements inside functions as (first line, last line, block), and each line's place."""

    def __init__(self, lines):
        self.statements, self.places = [], [""] * len(lines)
        blocks, start = [("", 0, "")], 0
        for number, line in enumerate(lines):
            code = line.strip()
            self.places[number] = blocks[-1][2]
            if not code:
                start = number + 1 if start == number else start
                continue
            unit = " ".join(lines[start:number + 1])
            for c in code:
                if c == "{":
                    inCode = blocks[-1][0] == "code"
                    isCode = (")" in unit or inCode or re.match(r"\s*(do|try|else)", unit)) \
                        and not re.match(r"\s*(const(expr)? .*=|(template <[^>]*> )?(class|struct|enum) )", unit)
                    place = blocks[-1][2] if inCode else self.nameOf(unit) or blocks[-1][2]
                    blocks.append(("code" if isCode else "other", number, place))
                    if not inCode: self.places[start:number + 1] = [place] * (number + 1 - start)
                elif c == "}":
                    blocks.pop()
            if blocks[-1][0] != "code" and code[-1] == ";" and self.nameOf(unit):
                self.places[start:number + 1] = [self.nameOf(unit)] * (number + 1 - start)
            if code[-1] == ";" and unit.count("{") == unit.count("}") and unit.count("(") == unit.count(")"):
                if blocks[-1][0] == "code": self.statements.append((start, number, blocks[-1][1]))
                start = number + 1
            elif code[-1] in "{}:" or code.endswith("};"):
                start = number + 1

    @staticmethod
    def nameOf(unit):
        """What a piece of code outside a function declares."""
        named = re.match(r"\s*(?:template <[^>]*> )?(?:class|struct|enum|namespace)(?: class)? (\w+)", unit) \
            or re.search(r"(\w+)(?:\[\w*\])?\s*(?:=|\{)", unit.split("(")[0]) \
            or re.search(r"(operator\s*[^\s(]+|~?\b(?!(?:if|for|while|switch|void|noexcept)\b)\w+)\s*\(", unit)
        return named[1] if named else ""


def closing(text, start):
    """Where the parenthesis at start is closed on the same line, and the commas at its level."""
    depth, commas = 0, []
    for at in range(start, len(text)):
        depth += text[at] in "([{"
        depth -= text[at] in ")]}"
        if depth == 0: return at, commas
        if text[at] == "," and depth == 1: commas.append(at)
    return None, []


def expressionChanges(code, line):
    """(begin, end, new text, kind) of changes on a line that take more than one word. `code` is the line
    with its literals blanked."""
    for match in re.finditer(r"(?<=[(,=?:] |.[(])-(?=[\w(])|(?<=return )-(?=[\w(])", code):
        yield *match.span(), "", "sign"
    for match in re.finditer(r"(?:(?<=return )|(?<= = ))(?=[\w(][^;?]* [*/] [^;?]*;$)", code):
        yield *match.span(), "-", "sign"
    for match in re.finditer(r"(?<=[( ])!(?=[\w(])", code):
        yield *match.span(), "", "negation"
    for match in re.finditer(r"\bif \((?!.*(?:[<>=!]=|&&|\|\|| [<>] |!\w))", code):
        end, _ = closing(code, match.end() - 1)
        if end and "=" not in code[match.end():end]:
            yield match.end(), end, f"!({line[match.end():end]})", "negation"
    for match in re.finditer(r"\bstd::(?:(min|max)|(f?abs|sqrt|floor|ceil|l?l?round|exp|log10))(?=[(<])", code):
        yield *match.span(), ("std::" + {"min": "max", "max": "min"}[match[1]]) if match[1] else "", "call"
    for match in re.finditer(r"(?<=\w)\(", code):
        if SYMMETRIC.search(code[:match.start()]): continue
        end, commas = closing(code, match.start())
        if not end: continue
        for begin, comma, behind in zip([match.start(), *commas], commas, [*commas[1:], end]):
            one, two = line[begin + 1:comma].strip(), line[comma + 1:behind].strip()
            if one != two and re.fullmatch(r"[\w.\->():]+ [\w.\->():]+", f"{one} {two}"):
                yield begin + 1, behind, f"{two}, {one}", "arguments"


def mutantsOf(path, source):
    """All mutants of a file. Comments, texts and characters are left as they are."""
    isHost = path.startswith("host/")
    text = blanked(r"//.*|/\*.*?\*/", source)
    code = blanked(PLAIN, re.sub(LITERAL, lambda match: "_" * len(match[0]), text))
    lines, codeLines, found = text.split("\n"), code.split("\n"), []
    outline = Outline(codeLines)

    def change(first, last, after, kind):
        new = "\n".join(lines[:first] + after + lines[last + 1:])
        before, after = (" ".join(" ".join(part).split()) for part in (lines[first:last + 1], after))
        found.append(tMutant(path, first + 1, outline.places[first] or "file", kind, before, after, new))

    for number, line in enumerate(codeLines):
        old = lines[number]
        for match in TOKEN.finditer(line):
            if match[0][0] in "<>" and LIMITS.match(line.strip()): continue
            change(number, number, [old[:match.start()] + replacement(match[0]) + old[match.end():]],
                   KIND_OF.get(match[0], "number"))
        for begin, end, new, kind in expressionChanges(line, old) if isHost else ():
            change(number, number, [old[:begin] + new + old[end:]], kind)
    for first, last, _ in outline.statements:
        plain = codeLines[first].strip()
        following = next((line for line in codeLines[last + 1:] if line.strip()), "")
        isLastReturn = plain.startswith("return ") and following.startswith("}")
        if plain and not isLastReturn and not (DECLARATION.match(plain) and (" = " in plain or isHost)):
            change(first, last, [""] * (last - first + 1), "removal")
    for (first, firstEnd, block), (second, secondEnd, otherBlock) in itertools.pairwise(outline.statements):
        starts = codeLines[first].strip(), codeLines[second].strip()
        if block == otherBlock and all(starts) and not "".join(codeLines[firstEnd + 1:second]).strip() \
                and not any(LEAVES.match(start) or BARE.match(start) for start in starts) \
                and not all(DECLARATION.match(start) for start in starts) \
                and not independent(*starts) and not independent(*reversed(starts)) \
                and (not isHost or feeds(*starts) or feeds(*reversed(starts))):
            change(first, secondEnd, lines[second:secondEnd + 1] + lines[firstEnd + 1:second]
                   + lines[first:firstEnd + 1], "order")
    return sorted(found, key=lambda mutant: mutant.line)

