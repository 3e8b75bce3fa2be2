# SPDX-License-Identifier: Apache-2.0
"""The faults that scripts/mutate plants: small changes of C++ text, found by its shape.

Nothing here understands C++. The sources are formatted by one tool, so that a comparison has spaces around it
and a statement starts its line; what comes out wrong does not compile, and is not counted.
"""
import re

# What is no code: comments, texts, characters (not the marks between digits), directives.
NO_CODE = re.compile(
    r'//[^\n]*|/\*.*?\*/|"(?:\\.|[^"\\\n])*"|(?<![\w])\'(?:\\.|[^\'\\\n])+\'|^[ \t]*#(?:\\\n|[^\n])*', re.DOTALL | re.MULTILINE)
OPEN, CLOSE = "([{", ")]}"
# Words that start what is no plain statement.
OTHER_STATEMENT = re.compile(r"(return|if|for|while|do|switch|case|default|else|using|class|struct|enum|namespace|"
                             r"template|public|private|protected|friend|break|continue|static_assert|extern)\b")
DECLARATION = re.compile(r"(?:[\w:]+(?:<[^;=()]*>)?(?:::\w+)*[*&]* )+[*&]*[\w:~]+\b|auto\b|\[\[|~?\w+\(.*\) (?:=|:)|operator\b")

COMPARISONS = {"==": ["!="], "!=": ["=="], "<": ["<=", ">="], "<=": ["<", ">"], ">": [">=", "<="], ">=": [">", "<"]}
OPERATORS = {"+": "-", "-": "+", "*": "/", "/": "*", "+=": "-=", "-=": "+=", "|": "&", "&": "|", "&&": "||", "||": "&&"}
WORDS = {"std::min": "std::max", "std::max": "std::min", "front": "back", "back": "front", "lower_bound": "upper_bound",
         "upper_bound": "lower_bound", "IsBefore": "IsAfter", "IsAfter": "IsBefore", "IsBeforeOrEqual": "IsBefore",
         "any_of": "all_of", "all_of": "any_of", "break": "continue", "continue": "break", "true": "false",
         "false": "true"}


class Fault:
    """One change of one file: text[start:end] becomes `new`."""

    def __init__(self, code, start, end, new):
        self.path, self.start, self.end = code.path, start, end
        # Lines keep their numbers: libcrypto's errors carry them.
        self.new = new + "\n" * (code.text.count("\n", start, end) - new.count("\n"))
        self.line = code.text.count("\n", 0, start) + 1
        self.place = code.place(start)
        first, last = code.text.rfind("\n", 0, start) + 1, (code.text + "\n").find("\n", end)
        self.was = " ".join(code.text[first:last].split())
        self.becomes = " ".join((code.text[first:start] + new + code.text[end:last]).split())

    def key(self):
        """What tells it from all others, also after other lines of the file have changed."""
        return (self.path, self.place, self.was, self.becomes)


class Code:
    def __init__(self, path, text):
        self.path, self.text = path, text
        self.code = NO_CODE.sub(lambda found: re.sub(r"[^\n]", "_" if found[0][0] in "\"'" else " ", found[0]), text)

    def place(self, position):
        """The function or class around a position."""
        for line in reversed(self.code[:position + 1].splitlines()):
            if re.match(r"[A-Za-z_\[]", line):
                name = re.search(r"(operator[^\s\w(]+|[\w:~]+)\(", line) or re.search(r"(?:class|struct|enum) (\w+)", line)
                return name[1] if name else line.split("=")[0].split()[-1]
        return "-"

    def match(self, position):
        """Behind the bracket that closes the one at `position`."""
        depth = 0
        for i in range(position, len(self.code)):
            depth += (self.code[i] in OPEN) - (self.code[i] in CLOSE)
            if depth == 0:
                return i + 1
        return len(self.code)

    def operand_before(self, position):
        """Where the operand starts that ends at `position`."""
        depth = 0
        for i in range(position - 1, 0, -1):
            depth += (self.code[i] in CLOSE) - (self.code[i] in OPEN)
            if depth < 0 or (depth == 0 and re.match(r"[;,?]|&& |\|\| |[^=!<>]= |return\b|: ", self.code[i:])):
                word = re.match(r"[(\[{;,?]\s*|&& |\|\| |.= |return |: |\w", self.code[i:])
                return i + (word.end() if word else 1)
        return position

    def operand_behind(self, position):
        """Where the operand ends that starts at `position`."""
        depth = 0
        for i in range(position, len(self.code)):
            depth += (self.code[i] in OPEN) - (self.code[i] in CLOSE)
            if depth < 0 or (depth == 0 and re.match(r"[;,]| && | \|\| | \? | : ", self.code[i:])):
                return i
        return position

    def statements(self):
        """The plain statements that start a line: (start, end), without declarations."""
        end = ";"
        for found in re.finditer(r"^( *)(\S[^\n]*)$", self.code, re.MULTILINE):
            starts, end = end in ";{}:", found[2].rstrip()[-1]
            start = found.start(2)
            text = self.code[start:start + 200]
            if not starts or not re.match(r"[\w*(:+-]", text) or OTHER_STATEMENT.match(text) or DECLARATION.match(text):
                continue
            stop = self.operand_end(start)
            if stop and found[1]:
                yield start, stop

    def operand_end(self, start):
        """Behind the semicolon of the statement that starts here; None where a block comes first."""
        depth = 0
        for i in range(start, len(self.code)):
            depth += (self.code[i] in "([") - (self.code[i] in ")]")
            if depth == 0 and self.code[i] == "{" and self.code[i - 1] == " ":
                return None
            if depth == 0 and self.code[i] == ";":
                return i + 1
        return None


# ---- The kinds of faults, each giving (start, end, new text) -------------------------------------


def operators(code):
    """A comparison flipped, an operator that becomes its opposite, a word that becomes its opposite."""
    for found in re.finditer(r"(?<=\s)(==|!=|<=|>=|<|>|\+=|-=|&&|\|\||[-+*/|&])(?=\s)", code.code):
        for other in COMPARISONS.get(found[1]) or [OPERATORS[found[1]]]:
            yield found.start(), found.end(), other
    for found in re.finditer(r"\+\+|--", code.code):
        yield found.start(), found.end(), "--" if found[0] == "++" else "++"
    for found in re.finditer("|".join(rf"\b{word}\b" for word in WORDS), code.code):
        yield found.start(), found.end(), WORDS[found[0]]


def is_one_comparison(condition):
    """Whether operators() negates it already."""
    return not re.search(r"&&|\|\||\?", condition) and re.search(r"^!| (==|!=|<|<=|>|>=) ", condition)


def negations(code):
    """A negation dropped; a condition negated, or decided beforehand."""
    for found in re.finditer(r"!(?=[\w(])", code.code):
        yield found.start(), found.end(), ""
    for found in re.finditer(r"\b(?:if|while|VESK2_REQUIRE)( ?)\(", code.code):
        start, end = found.end(), code.match(found.end() - 1) - 1
        if not found[1]:
            end = code.operand_behind(start)
        condition = code.text[start:end]
        if not is_one_comparison(condition):
            yield start, end, f"!({condition})"
        yield start, end, f"false && ({condition})"
        if "while" not in found[0] and found[1]:
            yield start, end, f"true || ({condition})"
    for found in re.finditer(r" \? ", code.code):
        start = code.operand_before(found.start())
        if not is_one_comparison(code.text[start:found.start()]):
            yield start, found.start(), f"!({code.text[start:found.start()]})"


def checks(code):
    """One of several conditions dropped, a check dropped, its code forced to success."""
    for found in re.finditer(r"\s(&&|\|\|)\s+", code.code):
        yield code.operand_before(found.start()), found.end(), ""
        yield found.start(), code.operand_behind(found.end()), ""
    for found in re.finditer(r"\bVESK2_REQUIRE\(", code.code):
        end = code.match(found.end() - 1)
        comma = code.operand_behind(found.end())
        yield comma, end - 1, ", 0"
    for found in re.finditer(r"\bVESK2_TRY(?=\()", code.code):
        yield found.start(), found.end(), "(void)"


def constants(code):
    """A constant moved by one."""
    for found in re.finditer(r"(?<![\w.'])(0x[0-9A-Fa-f]+|\d[\d']*)(?=[uUlL]*(?![\w.']))", code.code):
        value = int(found[1].replace("'", ""), 0)
        for moved in [value + 1] + ([value - 1] if value > 0 else []):
            yield found.start(), found.end(), str(moved)
    for found in re.finditer(r"\bLimits::k\w+", code.code):
        for moved in ("+ 1", "- 1"):
            yield found.start(), found.end(), f"({found[0]} {moved})"


def returns(code):
    """A return forced to success, to failure, or to the opposite."""
    for found in re.finditer(r"\breturn ([^;{}]+);", code.code):
        value = code.text[found.start(1):found.end(1)]
        if value in ("true", "false", "0", "nullptr"):
            continue
        for forced in ("0", "1", f"!({value})"):
            if forced != value and not (forced[0] == "!" and is_one_comparison(value)):
                yield found.start(1), found.end(1), forced


def are_independent(first, second):
    """Whether the order of two assignments makes no difference."""
    sides = [re.fullmatch(r"([\w.>\[\]-]+) = ([^()]*);", text) for text in (first, second)]
    return all(sides) and sides[0][1] not in second and sides[1][1] not in first


def statements(code):
    """A statement dropped, or put before its neighbour; arguments in another order."""
    last = None
    for start, end in code.statements():
        yield start, end, ";"
        between = code.text[last[1]:start] if last else ""
        if last and re.fullmatch(r"\n *", between):
            first, second = code.text[last[0]:last[1]], code.text[start:end]
            if first != second and not are_independent(first, second):
                yield last[0], end, second + between + first
        last = (start, end)
    word = r"[\w.>:*&\[\]-]+"
    for found in re.finditer(rf"(?<=[(,{{ ])({word}), ({word})(?=[,)}}])", code.code):
        first, second = code.text[found.start(1):found.end(1)], code.text[found.start(2):found.end(2)]
        if first != second:
            yield found.start(), found.end(), f"{second}, {first}"


def all_faults(path, text):
    """Every fault of a file, in the order of its lines."""
    code = Code(path, text)
    found = {}
    for kind in (operators, negations, checks, constants, returns, statements):
        for start, end, new in kind(code):
            fault = Fault(code, start, end, new)
            if "static_assert" not in fault.was and fault.was != fault.becomes:
                found.setdefault(fault.key(), fault)
    return sorted(found.values(), key=lambda fault: (fault.start, fault.end, fault.new))
