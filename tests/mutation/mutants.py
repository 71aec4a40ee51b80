"""Makes mutants of C++ sources from their text: one small change each, with a name that holds."""

import re
from collections import Counter
from dataclasses import dataclass

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
    """Without the parameters of templates, hardly a change of which compiles."""
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


# An operator has blanks on both sides, as the sources are formatted; what looks like one and has
# not is a bracket of a template, a reference or a pointer.
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

# What stands for these words in turn. An empty one takes the word away.
WORDS = {
    "true": ("false",),
    "false": ("true",),
    "double": ("float",),
    "float": ("double",),
    "uint8_t": ("int8_t",),
    "uint16_t": ("int16_t",),
    "uint32_t": ("int32_t",),
    "uint64_t": ("int64_t",),
    "is_signed_v": ("is_unsigned_v",),
    "is_unsigned_v": ("is_signed_v",),
    "is_integral_v": ("is_floating_point_v",),
    "is_floating_point_v": ("is_integral_v",),
    "is_integral": ("is_floating_point",),
    "is_floating_point": ("is_integral",),
    "conjunction_v": ("disjunction_v",),
    "disjunction_v": ("conjunction_v",),
    "make_unsigned_t": ("make_signed_t",),
    "min": ("max",),
    "denorm_min": ("min",),
    "epsilon": ("min",),
    "digits": ("digits10",),
    "fabs": ("trunc",),
    "__builtin_fabs": ("__builtin_trunc",),
    "__builtin_fabsf": ("__builtin_truncf",),
    "volatile": ("",),
    "thread_local": ("",),
    "equality": ("nearness<float>",),
    "avx2": ("avx512",),
}

# Types of variables with an initial value.
NARROWER = {"talint": "short", "size_t": "uint16_t", "D": "std::uint8_t"}

# Names that are easily taken for each other, besides those that differ by 1 and 2 or by x and y.
TAKEN_FOR = {
    "real_part": "imaginary_part",
    "imaginary_part": "real_part",
    "rdata1": "idata1",
    "idata1": "rdata1",
    "rdata2": "idata2",
    "idata2": "rdata2",
    "diff": "max",
    "begin": "end",
    "in_pages": "passed",
}

# Attributes that change more than speed.
TELLING_ATTRIBUTE = re.compile(r"visibility|tls_model")

_SWAPPED = str.maketrans("12xy", "21yx")


def other_name(name, names):
    if name in TAKEN_FOR:
        return TAKEN_FOR[name]
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

    def _replaced(self, token, texts):
        for text in texts:
            yield Change(token.begin, token.end, text)

    def _token_changes(self, index, token):
        if token.kind == "mark":
            yield from self._mark_changes(token)
        elif token.kind == "number":
            yield from self._replaced(token, other_numbers(token.text))
        elif token.kind == "attribute" and TELLING_ATTRIBUTE.search(token.text):
            yield Change(token.begin, token.end, "")
        elif token.kind == "word":
            yield from self._word_changes(index, token)

    def _mark_changes(self, token):
        if token.text in OPERATORS and self._spaced(token):
            yield from self._replaced(token, OPERATORS[token.text])
        elif token.text in ("!", "-", "~") and not self.text[token.end].isspace():
            # Of one operand: taken away.
            yield Change(token.begin, token.end, "")
        elif token.text == "++":
            yield from self._replaced(token, ["--"])

    def _word_changes(self, index, token):
        before, after = self._text_at(index - 1), self._text_at(index + 1)
        if token.text in WORDS and not (token.text == "min" and before == "&"):
            yield from self._replaced(token, WORDS[token.text])
        if token.text in NARROWER and self._text_at(index + 2) == "=":
            yield Change(token.begin, token.end, NARROWER[token.text])
        declared = self.tokens[index - 1].kind == "word" and before not in ("return", "else")
        glued = before in ("*", "&", ">") and self.text[token.begin - 2] != " "
        other = other_name(token.text, self.names)
        if other and not declared and not (glued and after in (",", ")", "=", ";", "(")):
            yield Change(token.begin, token.end, other)

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

    def _range_text(self, span):
        return self.text[self.tokens[span[0]].begin : self.tokens[span[1]].end]

    def _statement_changes(self):
        statements = list(self._statements())
        for span in statements:
            yield Change(self.tokens[span[0]].begin, self.tokens[span[1]].end, ";")
        for spans in (statements, list(self._returning_ifs())):
            for one, other in zip(spans, spans[1:]):
                if one[1] + 1 == other[0]:
                    begin, end = self.tokens[one[0]].begin, self.tokens[other[1]].end
                    between = self.text[self.tokens[one[1]].end : self.tokens[other[0]].begin]
                    yield Change(begin, end,
                                 self._range_text(other) + between + self._range_text(one), True)


# ---- Mutants

@dataclass(frozen=True)
class Mutant:
    name: str
    path: str
    line: int
    change: Change

    def applied(self, text):
        return text[: self.change.begin] + self.change.text + text[self.change.end :]


def shown(text, most=60):
    text = " ".join(text.split())
    return text if len(text) <= most else text[: most - 3] + "..."


class Places:
    """Names a place by the text of its line, with those in front of it where that stands twice."""

    def __init__(self, text):
        lines = [" ".join(line.split("//")[0].split()) for line in text.split("\n")]
        self.code = [(number, line) for number, line in enumerate(lines) if line]
        self.index = {number: index for index, (number, _) in enumerate(self.code)}
        self.starts = [0]
        for line in text.split("\n"):
            self.starts.append(self.starts[-1] + len(line) + 1)

    def line_of(self, offset):
        low = 0
        while self.starts[low + 1] <= offset:
            low += 1
        return low

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
        mutated = text[: change.begin] + change.text + text[change.end :]
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
