"""Mutants of whole statements, conditions and texts, for code that says more with these than with
single operators."""

import re
from dataclasses import replace

from mutants import Change, Source, closing

SCOPES = ("namespace", "class", "struct", "enum")
LEAVES = ("throw", "break", "continue")
DECLARES = ("using", "constexpr", "const", "static", "auto")
TYPE_ENDS = (">", ">>", "&", "*")
NO_VALUES = ("{}", "0", "false", "nullptr", "std::nullopt", '""')


class Bodies:
    """The statements and conditions in all bodies of functions, as pairs of indices of tokens."""

    def __init__(self, tokens):
        self.tokens = tokens
        self.actions = []  # assignments, calls, loops, leaps: what can be left out
        self.returns = []  # of a value
        self.conditions = []  # what is between the brackets of an `if`
        self._scope(0, len(tokens))

    def _text(self, index):
        return self.tokens[index].text if index < len(self.tokens) else ""

    # ---- Outside of functions

    def _scope(self, begin, end):
        head, index = begin, begin
        while index < end:
            if self._text(index) == "{":
                last = closing(self.tokens, index)
                head = self._braces(head, index, last)
                index = last
            elif self._text(index) == ";":
                head = index + 1
            index += 1

    def _braces(self, head, opening, last):
        """Goes through what is in the braces, and returns where the next declaration begins."""
        words = [token.text for token in self.tokens[head:opening]]
        if any(word in SCOPES for word in words[:2]) and "(" not in words:
            self._scope(opening + 1, last)
        elif self._text(last + 1) in (",", "{", ";") or "(" not in words or self._sets(words):
            return head  # an initial value
        else:
            self._body(opening + 1, last)
        return last + 1

    @staticmethod
    def _sets(words):
        return "=" in words[: words.index("(")]

    # ---- In functions

    def _body(self, begin, end):
        while begin < end:
            begin = self._statement(begin)

    def _statement(self, begin):
        """Goes through one statement and returns where the next one begins."""
        text = self._text(begin)
        if text == "{":
            last = closing(self.tokens, begin)
            self._body(begin + 1, last)
            return last + 1
        if text in ("case", "default"):
            while self._text(begin) != ":":
                begin += 1
            return begin + 1
        if text in ("try", "else"):
            return self._statement(begin + 1)
        if text in ("if", "for", "while", "switch", "catch"):
            return self._headed(begin, text)
        return self._simple(begin)

    def _headed(self, begin, text):
        opening = begin + 1 + (self._text(begin + 1) == "constexpr")
        last = closing(self.tokens, opening)
        if text == "if":
            self.conditions.append((opening + 1, last - 1))
        end = self._statement(last + 1)
        if text in ("for", "while") and end > last + 2:  # not the end of a do loop
            self.actions.append((begin, end - 1))
        return self._statement(end) if text == "if" and self._text(end) == "else" else end

    def _simple(self, begin):
        index = begin + (self._text(begin) == "do")
        if index > begin:
            return self._statement(index)
        while self._text(index) != ";":
            index = self._past(index)
        if self._text(begin) == "return" and index > begin + 1:
            self.returns.append((begin + 1, index - 1))
        elif self._is_action(begin):
            self.actions.append((begin, index))
        return index + 1

    def _past(self, index):
        """Past one token or a whole pair of brackets; goes through the bodies of lambdas."""
        if self._text(index) not in ("(", "[", "{"):
            return index + 1
        last = closing(self.tokens, index)
        if self._text(index) == "{" and self._text(index - 1) in (")", "]"):
            self._body(index + 1, last)
            return last + 1
        index += 1
        while index < last:
            index = self._past(index)
        return last + 1

    def _is_action(self, begin):
        """Whether it is more than a declaration, which has two words or a type and a word side by
        side."""
        first = self._text(begin)
        if first in (*LEAVES, "return") or first in DECLARES:
            return first not in DECLARES
        begin += first == "*"
        words = []
        while self._text(begin) not in ("=", "(", "[", ";", "{"):
            words.append(self.tokens[begin])
            begin += 1
        return not any(two.kind == "word" and (one.kind == "word" or one.text in TYPE_ENDS)
                       for one, two in zip(words, words[1:]))


class WholeSource(Source):
    """A file of which statements, conditions and texts are changed, and operators, not names."""

    def __init__(self, text):
        super().__init__(text)
        self.bodies = Bodies(self.tokens)

    def changes(self):
        for index, token in enumerate(self.tokens):
            if token.kind == "word" and token.text in ("true", "false"):
                yield from self._word_changes(index, token)
            elif token.kind in ("mark", "number"):
                yield from self._token_changes(index, token)
            elif token.kind == "string":
                yield from self._string_changes(token)
        yield from self._argument_changes()
        yield from self._condition_changes()
        yield from self._statement_changes()
        yield from self._return_changes()

    def _string_changes(self, token):
        """Without its last letter."""
        letter = re.search(r'(?<!\\)[A-Za-z](?=(?:\\.|[^A-Za-z\\])*$)', token.text[:-1])
        if letter and not token.text.startswith('"\\x'):
            begin = token.begin + letter.start()
            yield Change(begin, begin + 1, "", whole=True)

    def _argument_changes(self):
        """Two names that are arguments side by side change places."""
        for index in range(1, len(self.tokens) - 4):
            before, one, comma, other, after = self.tokens[index : index + 5]
            if (before.text in ("(", ",") and comma.text == "," and after.text in (",", ")")
                    and one.kind == other.kind == "word"):
                yield Change(one.begin, other.end, f"{other.text}, {one.text}")

    def _condition_changes(self):
        for first, last in self.bodies.conditions:
            texts = [token.text for token in self.tokens[first : last + 1]]
            if ";" in texts:
                first += texts.index(";") + 1
            begin, end = self.tokens[first].begin, self.tokens[last].end
            for text in ("true", "false", f"!({self.text[begin:end]})"):
                yield Change(begin, end, text, whole=True)

    def _statements(self):
        return iter(sorted(self.bodies.actions))

    def _statement_changes(self):
        for change in super()._statement_changes():
            yield replace(change, whole=True)

    def _return_changes(self):
        for span in self.bodies.returns:
            if self._range_text(span) not in NO_VALUES:
                yield replace(self._replaced(span, "{}"), whole=True)
