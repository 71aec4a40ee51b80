"""Makes mutants of C++ sources from their text: one small change each, with a stable name."""

import bisect
import hashlib
import itertools
import operator
import re
from collections import Counter
from dataclasses import dataclass, replace

# ---- Tokens

_TOKEN = re.compile(
    r"""
    (?P<comment>//[^\n]*|/\*.*?\*/)
  | (?P<directive>^[ ]*\#(?:[^\n\\]|\\.|\\\n)*)
  | (?P<attribute>\[\[.*?\]\])
  | (?P<string>R"\(.*?\)"|"(?:[^"\\\n]|\\.)*")
  | (?P<character>'(?:[^'\\\n]|\\.)+')
  | (?P<number>\d[\w.']*(?:(?<=[eEpP])[+-][\w.]*)?)
  | (?P<word>[A-Za-z_]\w*)
  | (?P<mark>\.\.\.|<<=|>>=|[-+*/%&|^<>=!]=|<<|>>|&&|\|\||\+\+|--|->|::|[^\w\s])
    """,
    re.VERBOSE | re.DOTALL | re.MULTILINE,
)


@dataclass(frozen=True)
class Token:
    kind: str
    text: str
    begin: int
    end: int

    def replaced(self, text):
        return Change(self.begin, self.end, text)


def code_of(source):
    """The text without comments and blanks."""
    return " ".join(match.group() for match in _TOKEN.finditer(source)
                    if match.lastgroup != "comment")


def tokens_of(source):
    """The tokens that a mutant may touch: without comments, directives and static assertions."""
    tokens = [
        Token(match.lastgroup, match.group(), match.start(), match.end())
        for match in _TOKEN.finditer(source)
        if match.lastgroup not in ("comment", "directive")
    ]
    return without_heads(without_assertions(tokens))


def without_assertions(tokens):
    kept, asserted = [], False
    for token in tokens:
        asserted = asserted or token.text == "static_assert"
        if not asserted:
            kept.append(token)
        asserted = asserted and token.text != ";"
    return kept


def without_heads(tokens):
    """Without template parameters, as almost no change to one compiles."""
    kept, depth, begins = [], 0, False
    for token in tokens:
        begins = begins or token.text == "template"
        if begins and token.text not in ("template", "<"):
            begins = False
        if begins and token.text == "<":
            depth, begins = 1, False
        elif depth:
            depth += {"<": 1, ">": -1, ">>": -2}.get(token.text, 0)
        else:
            kept.append(token)
    return kept


def closing(tokens, opening):
    """The index of the bracket that closes the one at `opening`."""
    depth = 0
    for index in range(opening, len(tokens)):
        depth += tokens[index].text in ("(", "{", "[")
        depth -= tokens[index].text in (")", "}", "]")
        if depth == 0:
            return index
    raise ValueError(f"nothing closes {tokens[opening]}")


# ---- Changes: a range of the source and what takes its place

@dataclass(frozen=True)
class Change:
    begin: int
    end: int
    text: str
    swaps: bool = False  # the order of two statements
    whole: bool = False  # statements, conditions or texts

    def applied(self, text):
        return text[: self.begin] + self.text + text[self.end :]


# An operator has blanks on both sides, as the sources are formatted. What looks like one without
# them is a bracket of a template, a reference or a pointer.
OPERATORS = {
    "<": ("<=", ">="),
    "<=": ("<", ">"),
    ">": (">=", "<="),
    ">=": (">", "<"),
    "==": ("!=",),
    "!=": ("==",),
    "&&": ("||",),
    "||": ("&&",),
    "+": ("-",),
    "-": ("+",),
    "*": ("/",),
    "/": ("*",),
    "%": ("/",),
    "<<": (">>",),
    ">>": ("<<",),
    "&": ("|",),
    "|": ("&",),
    "^": ("|",),
    "+=": ("-=",),
    "-=": ("+=",),
    "|=": ("&=", "="),
    "&=": ("|=",),
    "?": ("|| true ?", "&& false ?"),
}

def both_ways(*pairs):
    return {**dict(pairs), **{other: one for one, other in pairs}}


# What replaces these words. An empty one takes the word away.
WORDS = {
    **both_ways(("true", "false"), ("double", "float"), ("is_signed_v", "is_unsigned_v"),
                ("is_integral_v", "is_floating_point_v"), ("is_integral", "is_floating_point"),
                ("conjunction_v", "disjunction_v")),
    "uint8_t": "int8_t",
    "uint16_t": "int16_t",
    "uint32_t": "int32_t",
    "uint64_t": "int64_t",
    "make_unsigned_t": "make_signed_t",
    "min": "max",
    "denorm_min": "min",
    "epsilon": "min",
    "digits": "digits10",
    "fabs": "trunc",
    "__builtin_fabs": "__builtin_trunc",
    "__builtin_fabsf": "__builtin_truncf",
    "volatile": "",
    "thread_local": "",
    "equality": "nearness<float>",
    "avx2": "avx512",
}

# Types of variables with an initial value.
NARROWER = {"talint": "short", "size_t": "uint16_t", "D": "std::uint8_t"}

# Names that are easily confused, besides those that differ by 1 and 2 or by x and y.
CONFUSED = {
    **both_ways(("real_part", "imaginary_part"), ("rdata1", "idata1"), ("rdata2", "idata2")),
    "diff": "max",
    "begin": "end",
    "in_pages": "passed",
}

# Attributes that change more than speed.
TELLING_ATTRIBUTE = re.compile(r"visibility|tls_model")

_SWAPPED = str.maketrans("12xy", "21yx")


def other_name(name, names):
    if name in CONFUSED:
        return CONFUSED[name]
    other = re.sub(r"(?<![a-zA-Z])[xy](?![a-zA-Z])|(?<=n)[xy]$|[12](?=_?$)",
                   lambda match: match.group().translate(_SWAPPED), name)
    return other if other != name and other in names else None


def other_numbers(text):
    if "." in text:
        return ["0.25", "1.0"] if text == "0.5" else []
    if not text.isdigit():
        return []
    value = int(text)
    steps = [value + 1, value - 1] if value < 10 else [value + 1, value - 1, value * 2, value // 2]
    return [str(step) for step in steps if step >= 0]


class Source:
    """A file and the changes that can be made in it, in order."""

    def __init__(self, text):
        self.text = text
        self.tokens = tokens_of(text)
        self.names = {token.text for token in self.tokens if token.kind == "word"}

    def changes(self):
        for index, token in enumerate(self.tokens):
            yield from self._token_changes(index, token)
        yield from self._condition_changes()
        yield from self._statement_changes()

    def _text_at(self, index):
        return self.tokens[index].text if 0 <= index < len(self.tokens) else ""

    def _spaced(self, token):
        return self.text[token.begin - 1] in " \n" and self.text[token.end] in " \n"

    def _token_changes(self, index, token):
        if token.kind == "mark":
            yield from self._mark_changes(token)
        elif token.kind == "number":
            yield from map(token.replaced, other_numbers(token.text))
        elif token.kind == "attribute" and TELLING_ATTRIBUTE.search(token.text):
            yield token.replaced("")
        elif token.kind == "word":
            yield from self._word_changes(index, token)

    def _mark_changes(self, token):
        if token.text in OPERATORS and self._spaced(token):
            yield from map(token.replaced, OPERATORS[token.text])
        elif token.text in ("!", "-", "~") and not self.text[token.end].isspace():
            # An operator of one operand is taken away.
            yield token.replaced("")
        elif token.text == "++":
            yield token.replaced("--")

    def _word_changes(self, index, token):
        before, after = self._text_at(index - 1), self._text_at(index + 1)
        if token.text in WORDS and not (token.text == "min" and before == "&"):
            yield token.replaced(WORDS[token.text])
        if token.text in NARROWER and self._text_at(index + 2) == "=":
            yield token.replaced(NARROWER[token.text])
        declared = self.tokens[index - 1].kind == "word" and before not in ("return", "else")
        glued = before in ("*", "&", ">") and self.text[token.begin - 2] != " "
        other = other_name(token.text, self.names)
        if other and not declared and not (glued and after in (",", ")", "=", ";", "(")):
            yield token.replaced(other)

    def _condition_changes(self):
        for index, token in enumerate(self.tokens):
            if token.text not in ("if", "while"):
                continue
            opening = index + 1 + (self._text_at(index + 1) == "constexpr")
            last = closing(self.tokens, opening)
            begin, end = self.tokens[opening].end, self.tokens[last].begin
            for text in ("true", "false") if token.text == "if" else ("false",):
                yield Change(begin, end, text)

    # ---- Statements

    def _statements(self):
        """Pairs of indices, the first and last token, of each assignment and call."""
        begin = 0
        for index, token in enumerate(self.tokens):
            if token.text == ";" and self._is_action(begin):
                yield begin, index
            if token.text in (";", "{", "}"):
                begin = index + 1

    def _is_action(self, begin):
        first, second = self.tokens[begin], self._text_at(begin + 1)
        if first.text in ("using", "return", "namespace", "for"):
            return False
        return (first.kind == "word" and second in ("=", "+=", "-=", "|=", "(", ".", "::")
                or first.text in ("(", "++"))

    def _returning_ifs(self):
        """Pairs of indices of each `if` whose whole body is a return."""
        for index, token in enumerate(self.tokens):
            if token.text != "if" or self._text_at(index + 1) != "(":
                continue
            opening = closing(self.tokens, index + 1) + 1
            last = closing(self.tokens, opening)
            if self._text_at(opening + 1) == "return" and self._text_at(last + 1) != "else":
                yield index, last

    def _replaced(self, span, text):
        return Change(self.tokens[span[0]].begin, self.tokens[span[1]].end, text)

    def _range_text(self, span):
        return self.text[self.tokens[span[0]].begin : self.tokens[span[1]].end]

    def _statement_changes(self):
        statements = list(self._statements())
        for span in statements:
            yield self._replaced(span, ";")
        for spans in (statements, list(self._returning_ifs())):
            for one, other in zip(spans, spans[1:]):
                if one[1] + 1 == other[0]:
                    between = self.text[self.tokens[one[1]].end : self.tokens[other[0]].begin]
                    swapped = self._range_text(other) + between + self._range_text(one)
                    yield replace(self._replaced((one[0], other[1]), swapped), swaps=True)


# ---- Mutants

@dataclass(frozen=True)
class Mutant:
    name: str
    path: str
    line: int
    change: Change

    def applied(self, text):
        return self.change.applied(text)

    @property
    def chance(self):
        """To choose among equals; the same in every run."""
        return hashlib.sha256(self.name.encode()).hexdigest()


def by_line(found):
    """The mutants of each line, as a list."""
    line = operator.attrgetter("line")
    return (list(of_line) for _, of_line in itertools.groupby(sorted(found, key=line), line))


def shown(text, most=60):
    text = " ".join(text.split())
    return text if len(text) <= most else text[: most - 3] + "..."


class Places:
    """Names a place by the text of its line, and by the lines before it where that occurs twice."""

    def __init__(self, text):
        lines = [" ".join(line.split("//")[0].split()) for line in text.split("\n")]
        self.code = [(number, line) for number, line in enumerate(lines) if line]
        self.index = {number: index for index, (number, _) in enumerate(self.code)}
        self.starts = [0]
        for line in text.split("\n"):
            self.starts.append(self.starts[-1] + len(line) + 1)

    def line_of(self, offset):
        return bisect.bisect_right(self.starts, offset) - 1

    def _run(self, index, count):
        return tuple(line for _, line in self.code[max(0, index - count + 1) : index + 1])

    def name(self, number):
        index = self.index[number]
        for count in range(1, 12):
            run = self._run(index, count)
            if sum(self._run(i, count) == run for i in range(len(self.code))) == 1:
                break
        return " ".join((run[0], "..", run[-1])) if count > 2 else " ".join(run)


def mutants_of(path, text, source=Source):
    """All mutants of the file, each with a name of its own that no edit elsewhere changes."""
    places = Places(text)
    found, seen, taken = [], set(), Counter()
    for change in source(text).changes():
        mutated = change.applied(text)
        if mutated in seen or mutated == text:
            continue
        seen.add(mutated)
        line = places.line_of(change.begin)
        what = f"{shown(text[change.begin:change.end])} -> {shown(change.text) or 'nothing'}"
        if change.swaps:
            what = f"{shown(change.text)} first"
        name = f"{path.split('/')[-1]}: {places.name(line)} [{what}]"
        taken[name] += 1
        if taken[name] > 1:
            name = f"{name[:-1]} ({taken[name]})]"
        found.append(Mutant(name, path, line + 1, change))
    return found
