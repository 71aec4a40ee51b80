"""Makes terms of functions in LLVM's intermediate representation.

A function is followed along each of its paths; what it gives on each is joined by the conditions of
the branches. Loops are followed as often as they run, so their ends must not depend on inputs. Every
instruction, flag and function that is not known here ends the translation with its name.

LLVM itself, by llvmlite, reads and verifies the module and says what each instruction is; operands are
taken from the line that it prints for the instruction.
"""

import collections
import re
import struct

import llvmlite.binding

import operations
import terms as t

llvmlite.binding.initialize()


class Unknown(Exception):
    """Something in the code that has no meaning here."""


# ---- Types: ("int", bits), ("real", ...), ("pointer",), ("void",), ("vector" or "array", count,
#      type), ("struct", types)


class Reader:
    """Reads types and operands from the text of an instruction."""

    TOKEN = re.compile(r'\s*(%"[^"]*"|@"[^"]*"|[%@][\w.$-]+|0x[0-9A-F]+|'
                       r"-?\d+\.\d+(?:e[+-]\d+)?|-?[\w.]+|[^\s\w])")

    def __init__(self, text, structs):
        self.tokens = self.TOKEN.findall(text)
        self.structs = structs
        self.position = 0

    def peek(self):
        return self.tokens[self.position] if self.position < len(self.tokens) else ""

    def next(self):
        self.position += 1
        return self.tokens[self.position - 1]

    def take(self, *expected):
        if self.peek() in expected:
            self.next()
            return True
        return False

    def type(self):
        token = self.next()
        if token in ("<", "["):
            count = int(self.next())
            self.next()
            element = self.type()
            self.next()
            found = ("vector" if token == "<" else "array", count, element)
        elif token == "{":
            found = ("struct", tuple(self.types_until("}")))
        elif token.startswith("%"):
            found = ("named", token)
        elif token in ("float", "double"):
            found = t.SINGLE if token == "float" else t.DOUBLE
        elif re.fullmatch(r"i\d+", token):
            found = ("int", int(token[1:]))
        elif token == "void":
            found = ("void",)
        else:
            raise Unknown(f"type {token}")
        if self.take("("):
            self.types_until(")")
        while self.take("*"):
            found = ("pointer",)
        return found

    def types_until(self, end):
        found = []
        while not self.take(end):
            found.append(self.type() if self.peek() != "." else self.next())
            self.take(",")
        return found

    def attributes(self):
        while re.fullmatch(r"noundef|nonnull|nocapture|readonly|writeonly|readnone|zeroext|signext|"
                           r"immarg|noalias|align|dereferenceable|tail|fastcc|returned", self.peek()):
            if self.next() in ("align", "dereferenceable"):
                self.take("(")
                self.next()
                self.take(")")


def layout(kind, structs):
    """The size of a type and its alignment, in bytes."""
    if kind[0] == "int":
        size = max(1, kind[1] // 8)
    elif kind[0] == "real":
        size = t.width_of(kind) // 8
    elif kind[0] == "named":
        return layout(structs[kind[1]], structs)
    elif kind[0] in ("vector", "array"):
        size, alignment = layout(kind[2], structs)
        return kind[1] * size, alignment
    elif kind[0] == "struct":
        end, alignment = 0, 1
        for field in kind[1]:
            size, aligned = layout(field, structs)
            end = -(-end // aligned) * aligned + size
            alignment = max(alignment, aligned)
        return -(-end // alignment) * alignment, alignment
    else:
        raise Unknown(f"the size of {kind}")
    return size, size


def field_offset(kind, index, structs):
    end = 0
    for position, field in enumerate(kind[1]):
        size, aligned = layout(field, structs)
        end = -(-end // aligned) * aligned
        if position == index:
            return end
        end += size
    raise Unknown("a field that is none")


# ---- Values: a term, a list of terms for a vector, or a pointer

Pointer = collections.namedtuple("Pointer", "object offset")


def lanes_of(value):
    return value if isinstance(value, list) else [value]


def sort_of(kind):
    if kind == ("int", 1):
        return t.BOOL
    return t.bits(kind[1]) if kind[0] == "int" else kind


def as_bits(value):
    """All bits of a value, its first lane the lowest."""
    parts = [t.bit(x) if x.sort == t.BOOL else t.bits_of(x) if x.sort[0] == "real" else x
             for x in lanes_of(value)]
    return t.concat(*reversed(parts))


def from_bits(whole, kind):
    if kind[0] == "vector":
        width = t.width_of(sort_of(kind[2]))
        return [from_bits(t.extract(whole, (k + 1) * width - 1, k * width), kind[2])
                for k in range(kind[1])]
    if kind == ("int", 1):
        return t.compared("=", whole, t.constant(1, 1))
    return t.from_bits(whole) if kind[0] == "real" else whole


# ---- Memory


class Memory:
    """An object in memory: cells of bits at offsets in bytes, with a name for what is unknown."""

    def __init__(self, name, cells=()):
        self.name = name
        self.cells = dict(cells)

    def copy(self):
        return Memory(self.name, self.cells)

    def load(self, offset, size):
        """The bits at a known place, or None if not all of them are known."""
        parts = []
        while size > 0:
            begin = next((b for b, cell in self.cells.items()
                          if b <= offset < b + cell.sort[1] // 8), None)
            if begin is None:
                return None
            cell = self.cells[begin]
            taken = min(size, begin + cell.sort[1] // 8 - offset)
            low = 8 * (offset - begin)
            parts.insert(0, t.extract(cell, low + 8 * taken - 1, low))
            offset += taken
            size -= taken
        return t.concat(*parts)

    def store(self, offset, value):
        size = value.sort[1] // 8
        for begin, cell in list(self.cells.items()):
            end = begin + cell.sort[1] // 8
            if begin < offset + size and offset < end:
                if begin < offset or end > offset + size:
                    raise Unknown(f"a store over part of {self.name}")
                del self.cells[begin]
        self.cells[offset] = value


def array_memory(name, width, count):
    """`count` elements of `width` bits: name0, name1 and so on."""
    return Memory(name, {k * width // 8: t.variable(f"{name}{k}", t.bits(width))
                         for k in range(count)})


# ---- Modules


Function = collections.namedtuple("Function", "parameters kinds blocks first")
Instruction = collections.namedtuple("Instruction", "opcode name text")


class Module:
    def __init__(self, text):
        # A context of its own, as in a shared one types of the same name get other names.
        context = llvmlite.binding.create_context()
        self.reference = llvmlite.binding.parse_assembly(text, context)
        self.reference.verify()
        self.functions = {f.name: f for f in self.reference.functions if not f.is_declaration}
        self.read = {}
        self.structs = {}
        for name, body in re.findall(r'^(%\S+|%"[^"]*") = type (.*)$', text, re.MULTILINE):
            self.structs[name] = Reader(body, self.structs).type()

    def function(self, name):
        if name not in self.read:
            self.read[name] = self.read_function(self.functions[name])
        return self.read[name]

    def read_function(self, reference):
        lines = joined_lines(str(reference))
        parameters = [str(a).rsplit(" ", 1)[1] for a in reference.arguments]
        kinds = [Reader(str(a), self.structs).type() for a in reference.arguments]
        blocks, first = {}, None
        # The first block has no label if it has no name; it comes after unnamed parameters.
        unnamed = sum(re.fullmatch(r"%\d+", name) is not None for name in parameters)
        printed = iter(lines)
        for block in reference.blocks:
            label, instructions = None, []
            for instruction in block.instructions:
                line = next(printed)
                while not line.startswith("  "):
                    found = re.match(r'("[^"]*"|[\w.$-]+):', line)
                    label = "%" + found[1] if found else label
                    line = next(printed)
                instructions.append(read_instruction(instruction.opcode, line))
            label = label or f"%{unnamed}"
            first = first or label
            blocks[label] = instructions
        return Function(parameters, kinds, blocks, first)


def joined_lines(text):
    """The lines of a function; a switch is one line."""
    text = re.sub(r"(switch[^\[]*\[)([^\]]*)\]", lambda m: m[1] + m[2].replace("\n", " ") + "]", text)
    return [line for line in text.split("\n") if line.strip()]


def read_instruction(opcode, line):
    text = re.sub(r", ![\w.]+ ![\w.]+|, ![\w.]+", "", line).strip()
    if "!range" in line or "!nonnull" in line:
        raise Unknown(f"metadata of {line.strip()}")
    name = None
    found = re.match(r'(%"[^"]*"|%[\w.$-]+) = (.*)', text)
    if found:
        name, text = found.groups()
    if opcode not in text.split():
        raise Unknown(f"{opcode} is not in {text}")
    return Instruction(opcode, name, text)


# ---- Following a function

INTEGER_OPERATIONS = {"add": "bvadd", "sub": "bvsub", "mul": "bvmul", "and": "bvand", "or": "bvor",
                      "xor": "bvxor", "shl": "bvshl", "lshr": "bvlshr", "ashr": "bvashr"}
REAL_OPERATIONS = {"fadd": "plus", "fsub": "minus", "fmul": "times", "fdiv": "over"}
INTEGER_PREDICATES = {"eq": ("=", False, False), "ne": ("=", False, True),
                      "ult": ("bvult", False, False), "ugt": ("bvult", True, False),
                      "ule": ("bvule", False, False), "uge": ("bvule", True, False),
                      "slt": ("bvslt", False, False), "sgt": ("bvslt", True, False),
                      "sle": ("bvsle", False, False), "sge": ("bvsle", True, False)}
CONVERSIONS = {"sitofp": "real_of_signed", "uitofp": "real_of_unsigned", "fptrunc": "real_of_real",
               "fpext": "real_of_real"}
FLAGS = ("nuw", "nsw", "inbounds", "exact", "volatile", "tail", "notail", "musttail")
# What would let a call of a function round as it likes; before a type these are no type.
RELAXED = {"fast", "nnan", "ninf", "nsz", "arcp", "contract", "afn", "reassoc"}
LONGEST_PATH = 1000000


class Path:
    """Where a path is: its frames, what is in memory, and what it has done."""

    def __init__(self):
        self.frames = []
        self.memory = {}
        self.condition = t.TRUE
        self.done = {}
        self.reads = collections.Counter()

    def fork(self, condition):
        other = Path()
        other.frames = [Frame(f.function, f.block, f.position, f.came_from, dict(f.values), f.result)
                        for f in self.frames]
        other.memory = {name: memory.copy() for name, memory in self.memory.items()}
        other.condition = t.conjunction(self.condition, condition)
        other.done = dict(self.done)
        other.reads = self.reads.copy()
        return other


class Frame:
    def __init__(self, function, block, position, came_from, values, result):
        self.function, self.block, self.position = function, block, position
        self.came_from, self.values, self.result = came_from, values, result


class Translation:
    """What a function gives: `result`, and what it does, by name; each a term.

    `opaque` maps parts of names of functions to handlers that are called with the path and the
    arguments in place of following these functions. `globals` maps names to memory.
    """

    def __init__(self, module, opaque=None):
        self.module = module
        self.opaque = opaque or {}
        self.globals = {}
        self.interrupted = False
        self.always = []
        self.used = collections.Counter()
        self.unknowns = 0
        self.steps = 0

    def outcome(self, name, arguments, memory):
        """The outcomes of calling the function with these values."""
        path = Path()
        path.memory = memory
        self.enter(path, name, arguments, None)
        return self.follow(path)

    def enter(self, path, name, arguments, result):
        function = self.module.function(name)
        values = dict(zip(function.parameters, arguments))
        path.frames.append(Frame(function, function.first, 0, None, values, result))

    def follow(self, path):
        while True:
            frame = path.frames[-1]
            instruction = frame.function.blocks[frame.block][frame.position]
            frame.position += 1
            self.steps += 1
            if self.steps > LONGEST_PATH:
                raise Unknown("a loop whose end depends on inputs")
            self.used[instruction.opcode] += 1
            try:
                if instruction.opcode == "ret":
                    value = self.returned(frame, instruction)
                    path.frames.pop()
                    if not path.frames:
                        return path.done if value is None else {**path.done, "result": value}
                    if frame.result:
                        path.frames[-1].values[frame.result] = value
                elif instruction.opcode == "br":
                    forked = self.branch(path, frame, instruction)
                    if forked is not None:
                        return forked
                elif instruction.opcode == "switch":
                    return self.switch(path, frame, instruction)
                elif instruction.opcode == "phi":
                    self.phis(frame)
                else:
                    self.execute(path, frame, instruction)
            except Unknown as unknown:
                raise Unknown(f"{unknown}\n  in: {instruction.text}") from None

    # ---- Operands

    def reader(self, text):
        return Reader(text, self.module.structs)

    def fresh(self, kind):
        if kind[0] == "vector":
            return [self.fresh(kind[2]) for _ in range(kind[1])]
        if kind[0] in ("named", "struct", "array"):
            return tuple(self.fresh(part) for part in self.parts(kind))
        self.unknowns += 1
        width = t.width_of(sort_of(kind))
        return from_bits(t.variable(f"any{self.unknowns}", t.bits(width)), kind)

    def parts(self, kind):
        kind = self.module.structs[kind[1]] if kind[0] == "named" else kind
        return kind[1] if kind[0] == "struct" else [kind[2]] * kind[1]

    def operand(self, frame, reader, kind):
        token = reader.next()
        if token.startswith("%"):
            return frame.values[token]
        if token in ("undef", "poison"):
            return self.fresh(kind)
        if token == "zeroinitializer":
            return from_bits(t.constant(0, self.width(kind)), kind)
        if token in ("true", "false"):
            return t.boolean(token == "true")
        if token == "<":
            lanes = [self.typed_operand(frame, reader) for _ in range(kind[1])]
            reader.take(">")
            return lanes
        if token.startswith("@"):
            return Pointer(self.global_object(token[1:].strip('"')), t.constant(0, 64))
        if token in ("getelementptr", "bitcast"):
            return self.constant_expression(frame, reader, token)
        if kind[0] == "int" and re.fullmatch(r"-?\d+", token):
            return t.boolean(int(token) & 1) if kind[1] == 1 else t.constant(int(token), kind[1])
        if kind[0] == "real":
            return real_constant(token, kind)
        raise Unknown(f"operand {token}")

    def global_object(self, name):
        return next((known for part, known in self.globals.items() if part in name), name)

    def width(self, kind):
        return kind[1] * self.width(kind[2]) if kind[0] == "vector" else t.width_of(sort_of(kind))

    def typed_operand(self, frame, reader):
        reader.take(",")
        kind = reader.type()
        reader.attributes()
        return self.operand(frame, reader, kind)

    def constant_expression(self, frame, reader, token):
        reader.take("inbounds")
        reader.take("(")
        if token == "bitcast":
            value = self.typed_operand(frame, reader)
            reader.take("to")
            reader.type()
        else:
            value = self.element_pointer(frame, reader)
        reader.take(")")
        return value

    def operands(self, frame, reader, kind, count):
        """Operands of one type, which stands before the first."""
        found = []
        for _ in range(count):
            found.append(self.operand(frame, reader, kind))
            reader.take(",")
        return found

    def start(self, instruction):
        """The reader behind the operation and its flags, and the flags."""
        reader = self.reader(instruction.text)
        while reader.next() != instruction.opcode:
            pass
        flags = []
        while reader.peek() in FLAGS:
            flags.append(reader.next())
        return reader, flags

    # ---- Control flow

    def returned(self, frame, instruction):
        reader, _ = self.start(instruction)
        return None if reader.peek() == "void" else self.typed_operand(frame, reader)

    def jump(self, frame, label):
        frame.came_from, frame.block, frame.position = frame.block, label, 0

    def branch(self, path, frame, instruction):
        labels = re.findall(r'label (%"[^"]*"|%[\w.$-]+)', instruction.text)
        if len(labels) == 1:
            self.jump(frame, labels[0])
            return None
        reader, _ = self.start(instruction)
        condition = self.typed_operand(frame, reader)
        if t.is_constant(condition):
            self.jump(frame, labels[0 if condition is t.TRUE else 1])
            return None
        return self.fork(path, [(condition, labels[0])], labels[1])

    def switch(self, path, frame, instruction):
        reader, _ = self.start(instruction)
        value = self.typed_operand(frame, reader)
        default, *labels = re.findall(r'label (%"[^"]*"|%[\w.$-]+)', instruction.text)
        cases = re.findall(r"i\d+ (-?\d+), label", instruction.text)
        conditions = [t.compared("=", value, t.constant(int(case), value.sort[1])) for case in cases]
        return self.fork(path, list(zip(conditions, labels)), default)

    def fork(self, path, ways, default):
        """Follows the first way whose condition holds, or else the default."""
        if not ways:
            self.jump(path.frames[-1], default)
            return self.follow(path)
        (condition, label), *rest = ways
        yes = path.fork(condition)
        self.jump(yes.frames[-1], label)
        return joined(condition, self.follow(yes),
                      self.fork(path.fork(t.negation(condition)), rest, default))

    def phis(self, frame):
        """All at the beginning of a block at once, as each sees the values before the jump."""
        frame.position -= 1
        found = {}
        while (instruction := frame.function.blocks[frame.block][frame.position]).opcode == "phi":
            frame.position += 1
            reader, _ = self.start(instruction)
            kind = reader.type()
            while reader.take("["):
                position = reader.position
                label = self.label_of_way(reader)
                if label == frame.came_from:
                    behind, reader.position = reader.position, position
                    found[instruction.name] = self.operands(frame, reader, kind, 1)[0]
                    reader.position = behind
                reader.take(",")
        frame.values.update(found)

    @staticmethod
    def label_of_way(reader):
        depth = 0
        while reader.peek() != "]" or depth:
            depth += {"[": 1, "]": -1}.get(reader.peek(), 0)
            label = reader.next()
        reader.next()
        return label

    # ---- Instructions

    def execute(self, path, frame, instruction):
        method = getattr(self, "do_" + instruction.opcode, None)
        reader, flags = self.start(instruction)
        if instruction.opcode in INTEGER_OPERATIONS:
            value = self.integer_operation(path, frame, instruction, reader, flags)
        elif instruction.opcode in REAL_OPERATIONS:
            kind = reader.type()
            value = t.by_lanes(lambda a, b: t.rounded(REAL_OPERATIONS[instruction.opcode], a, b),
                             *self.operands(frame, reader, kind, 2))
        elif instruction.opcode in CONVERSIONS:
            value, kind = self.conversion(frame, reader)
            element = kind[2] if kind[0] == "vector" else kind
            value = t.by_lanes(lambda a: t.converted(CONVERSIONS[instruction.opcode], a, element), value)
        elif method is not None:
            value = method(path, frame, reader, instruction)
        else:
            raise Unknown(f"instruction {instruction.opcode}")
        if instruction.name and value is not None:
            frame.values[instruction.name] = value

    def integer_operation(self, path, frame, instruction, reader, flags):
        kind = reader.type()
        a, b = self.operands(frame, reader, kind, 2)
        if kind[-1] == 1 or kind[-1] == ("int", 1):
            return t.by_lanes(BOOLEAN_OPERATIONS[instruction.opcode], a, b)
        op = INTEGER_OPERATIONS[instruction.opcode]
        value = t.by_lanes(lambda x, y: t.of_bits(op, x, y), a, b)
        for flag in flags:
            for x, y, z in zip(lanes_of(a), lanes_of(b), lanes_of(value)):
                self.require(path, is_exact(op, flag, x, y, z))
        if op in ("bvshl", "bvlshr", "bvashr"):
            for y in lanes_of(b):
                width = y.sort[1]
                self.require(path, t.compared("bvult", y, t.constant(width, width)))
        return value

    def require(self, path, condition):
        """What has to hold wherever this path goes, for the code to mean anything."""
        if condition is not t.TRUE:
            self.always.append(t.disjunction(t.negation(path.condition), condition))

    def conversion(self, frame, reader):
        kind = reader.type()
        value = self.operands(frame, reader, kind, 1)[0]
        reader.take("to")
        return value, reader.type()

    def do_icmp(self, path, frame, reader, instruction):
        del path, instruction
        op, swapped, negated = INTEGER_PREDICATES[reader.next()]
        kind = reader.type()
        a, b = self.operands(frame, reader, kind, 2)
        if swapped:
            a, b = b, a
        found = t.by_lanes(lambda x, y: t.compared(op, x, y), a, b)
        return t.by_lanes(t.negation, found) if negated else found

    def do_fcmp(self, path, frame, reader, instruction):
        del path, instruction
        predicate = reader.next()
        kind = reader.type()
        return t.by_lanes(lambda x, y: real_comparison(predicate, x, y),
                        *self.operands(frame, reader, kind, 2))

    def do_fneg(self, path, frame, reader, instruction):
        del path, instruction
        kind = reader.type()
        return t.by_lanes(t.negative, *self.operands(frame, reader, kind, 1))

    def do_select(self, path, frame, reader, instruction):
        del path, instruction
        condition = self.typed_operand(frame, reader)
        yes, no = self.typed_operand(frame, reader), self.typed_operand(frame, reader)
        if isinstance(condition, list):
            return t.by_lanes(t.choice, condition, yes, no)
        if isinstance(yes, list):
            return [t.choice(condition, a, b) for a, b in zip(yes, no)]
        return chosen(condition, yes, no)

    def do_sext(self, path, frame, reader, instruction):
        del path
        value, kind = self.conversion(frame, reader)
        width = self.width(kind[2] if kind[0] == "vector" else kind)
        op = {"sext": "sign_extend", "zext": "zero_extend"}[instruction.opcode]
        return t.by_lanes(lambda a: t.extended(op, a, width), value)

    do_zext = do_sext

    def do_trunc(self, path, frame, reader, instruction):
        del path, instruction
        value, kind = self.conversion(frame, reader)
        width = self.width(kind[2] if kind[0] == "vector" else kind)
        return t.by_lanes(lambda a: t.truncated(a, width), value)

    def do_fptosi(self, path, frame, reader, instruction):
        del instruction
        value, kind = self.conversion(frame, reader)
        least, above = (t.from_bits(real_bits(number, value.sort))
                        for number in (-2.0 ** (kind[1] - 1), 2.0 ** (kind[1] - 1)))
        self.require(path, t.conjunction(t.compared_reals("fp.leq", least, value),
                                         t.compared_reals("fp.lt", value, above)))
        return t.signed_of_real(value, kind[1])

    def do_bitcast(self, path, frame, reader, instruction):
        del path, instruction
        value, kind = self.conversion(frame, reader)
        return value if isinstance(value, Pointer) else from_bits(as_bits(value), kind)

    def do_freeze(self, path, frame, reader, instruction):
        del path, instruction
        return self.typed_operand(frame, reader)

    def do_shufflevector(self, path, frame, reader, instruction):
        del path, instruction
        a, b = self.typed_operand(frame, reader), self.typed_operand(frame, reader)
        reader.take(",")
        mask = reader.type()
        if reader.peek() == "zeroinitializer":
            places = [0] * mask[1]
        else:
            places = [None if p in ("undef", "poison") else int(p)
                      for p in re.findall(r"i32 (-?\w+)", " ".join(reader.tokens[reader.position:]))]
        both = a + b
        sort = both[0].sort
        kind = ("int", t.width_of(sort)) if sort == t.BOOL or sort[0] == "bits" else sort
        return [self.fresh(kind) if p is None else both[p] for p in places]

    def do_insertelement(self, path, frame, reader, instruction):
        del path, instruction
        vector, value = self.typed_operand(frame, reader), self.typed_operand(frame, reader)
        place = known(self.typed_operand(frame, reader))
        return vector[:place] + [value] + vector[place + 1:]

    def do_insertvalue(self, path, frame, reader, instruction):
        """A struct or array is a tuple of its parts."""
        del path, instruction
        whole, value = self.typed_operand(frame, reader), self.typed_operand(frame, reader)
        place = int(reader.tokens[-1])
        return whole[:place] + (value,) + whole[place + 1:]

    def do_extractvalue(self, path, frame, reader, instruction):
        del path, instruction
        return self.typed_operand(frame, reader)[int(reader.tokens[-1])]

    def do_extractelement(self, path, frame, reader, instruction):
        del path, instruction
        vector = self.typed_operand(frame, reader)
        return vector[known(self.typed_operand(frame, reader))]

    # ---- Memory

    def do_getelementptr(self, path, frame, reader, instruction):
        del path, instruction
        return self.element_pointer(frame, reader)

    def element_pointer(self, frame, reader):
        kind = reader.type()
        pointer = self.typed_operand(frame, reader)
        offset = pointer.offset
        is_first = True
        while reader.peek() == ",":
            index = self.typed_operand(frame, reader)
            index = index if index.sort[1] == 64 else t.extended("sign_extend", index, 64)
            kind = self.module.structs[kind[1]] if kind[0] == "named" else kind
            if not is_first and kind[0] == "struct":
                place = known(index)
                step = t.constant(field_offset(kind, place, self.module.structs), 64)
                kind = kind[1][place]
            else:
                kind = kind if is_first else kind[2]
                size = layout(kind, self.module.structs)[0]
                step = t.of_bits("bvmul", index, t.constant(size, 64))
            offset = t.of_bits("bvadd", offset, step)
            is_first = False
        return Pointer(pointer.object, offset)

    def do_alloca(self, path, frame, reader, instruction):
        del frame, reader
        name = f"local{len(path.memory)} {instruction.name}"
        path.memory[name] = Memory(name)
        return Pointer(name, t.constant(0, 64))

    def do_load(self, path, frame, reader, instruction):
        kind = reader.type()
        pointer = self.typed_operand(frame, reader)
        if kind[0] == "vector":
            size = self.width(kind[2]) // 8
            return [self.load(path, Pointer(pointer.object, t.of_bits(
                "bvadd", pointer.offset, t.constant(k * size, 64))), kind[2]) for k in range(kind[1])]
        volatile = " volatile " in instruction.text
        return self.load(path, pointer, kind, volatile)

    def load(self, path, pointer, kind, volatile=False):
        memory = path.memory.get(pointer.object)
        if memory is None:
            raise Unknown(f"a load from {pointer.object}")
        size = max(1, self.width(kind) // 8)
        if t.is_constant(pointer.offset):
            offset = t.value_of(pointer.offset)
            found = memory.load(offset, size)
            if found is None:
                raise Unknown(f"a load of {size} bytes at {offset}, outside what {memory.name} has")
            if volatile:
                found = self.read_again(path, memory, offset, found)
        else:
            found = self.load_at_index(path, pointer, memory, size)
        return from_bits(found if self.width(kind) > 1 else t.extract(found, 0, 0), kind)

    def read_again(self, path, memory, offset, found):
        """What is read again may have been changed by a signal handler."""
        if not self.interrupted:
            return found
        path.reads[memory.name, offset] += 1
        count = path.reads[memory.name, offset]
        if found.op != "variable" or count == 1:
            return found
        return t.variable(f"{found.arguments[0]}_read_{count}", found.sort)

    def load_at_index(self, path, pointer, memory, size):
        """Any of the cells of this size, as the offset says; it has to be one of them."""
        cells = {b: cell for b, cell in memory.cells.items() if cell.sort[1] == 8 * size}
        found = None
        places = []
        for begin, cell in cells.items():
            is_here = t.compared("=", pointer.offset, t.constant(begin, 64))
            places.append(is_here)
            found = cell if found is None else t.choice(is_here, cell, found)
        self.require(path, t.disjunction(*places))
        return found

    def do_store(self, path, frame, reader, instruction):
        value = self.typed_operand(frame, reader)
        pointer = self.typed_operand(frame, reader)
        memory = path.memory.get(pointer.object)
        if memory is None or memory.name in ("x", "y"):
            raise Unknown(f"a store to {pointer.object}")
        del instruction
        if t.is_constant(pointer.offset):
            memory.store(known(pointer.offset), as_bits(value))
        else:
            self.store_at_index(path, pointer, memory, as_bits(value))
        path.done.update({f"{memory.name}_{begin}": cell for begin, cell in memory.cells.items()
                          if memory.name == "cache"})

    def store_at_index(self, path, pointer, memory, value):
        """To any of the cells of this size, as the offset says; it has to be one of them."""
        places = []
        for begin, cell in memory.cells.items():
            if cell.sort == value.sort:
                is_here = t.compared("=", pointer.offset, t.constant(begin, 64))
                places.append(is_here)
                memory.cells[begin] = t.choice(is_here, value, cell)
        self.require(path, t.disjunction(*places))

    # ---- Calls

    def do_call(self, path, frame, reader, instruction):
        found = re.search(r'@("[^"]*"|[\w.$-]+)\(', instruction.text)
        if not found:
            raise Unknown("a call of a function that only the program knows")
        name = found[1].strip('"')
        changed = RELAXED.intersection(instruction.text[:found.start()].split())
        if changed:
            raise Unknown(f"arithmetic that is {' and '.join(sorted(changed))}")
        reader = self.reader(instruction.text[found.end():])
        arguments = []
        while reader.peek() != ")":
            arguments.append(self.typed_operand(frame, reader))
        for part, handler in self.opaque.items():
            if part in name:
                return handler(path, *arguments)
        if name in self.module.functions:
            self.enter(path, name, arguments, instruction.name)
            return None
        self.used[name] += 1
        operation = operations.find(name)
        if operation is None:
            raise Unknown(f"function {name}")
        return operation(path, *arguments)


# ---- What needs no path

BOOLEAN_OPERATIONS = {"and": t.conjunction, "or": t.disjunction,
                      "xor": lambda a, b: t.negation(t.compared("=", a, b))}


def known(term):
    if not t.is_constant(term):
        raise Unknown("an index or address that depends on inputs")
    return t.value_of(term)


def chosen(condition, a, b):
    if isinstance(a, Pointer):
        if a.object != b.object:
            raise Unknown("a choice of two objects")
        return Pointer(a.object, t.choice(condition, a.offset, b.offset))
    return t.choice(condition, a, b)


def joined(condition, a, b):
    """The outcomes of two ways."""
    found = {}
    for name in {**a, **b}:
        if name in a and name in b:
            found[name] = t.choice(condition, a[name], b[name])
        else:
            # What was not done has no arguments.
            done = a.get(name, b.get(name))
            is_done = condition if name in a else t.negation(condition)
            found[name] = t.conjunction(is_done, done) if done.sort == t.BOOL else done
    return found


def is_exact(op, flag, a, b, value):
    """Whether an operation loses nothing, as its flag says."""
    width = a.sort[1]
    if op in ("bvlshr", "bvashr"):
        return t.compared("=", t.of_bits("bvshl", value, b), a)
    extension = "sign_extend" if flag == "nsw" else "zero_extend"
    if op == "bvshl":
        back = "bvashr" if flag == "nsw" else "bvlshr"
        return t.compared("=", t.of_bits(back, value, b), a)
    wide = t.of_bits(op, *(t.extended(extension, x, 2 * width) for x in (a, b)))
    return t.compared("=", wide, t.extended(extension, value, 2 * width))


def real_comparison(predicate, a, b):
    if predicate in ("ord", "uno"):
        unordered = t.disjunction(t.is_nan(a), t.is_nan(b))
        return unordered if predicate == "uno" else t.negation(unordered)
    negated = predicate[0] == "u"
    # An unordered predicate is the opposite of the ordered one that it is not.
    kind = {"eq": "ne", "ne": "eq", "lt": "ge", "le": "gt", "gt": "le", "ge": "lt"}[predicate[1:]] \
        if negated else predicate[1:]
    found = {"eq": lambda: t.compared_reals("fp.eq", a, b),
             "ne": lambda: t.disjunction(t.compared_reals("fp.lt", a, b),
                                         t.compared_reals("fp.lt", b, a)),
             "lt": lambda: t.compared_reals("fp.lt", a, b),
             "gt": lambda: t.compared_reals("fp.lt", b, a),
             "le": lambda: t.compared_reals("fp.leq", a, b),
             "ge": lambda: t.compared_reals("fp.leq", b, a)}[kind]()
    return t.negation(found) if negated else found


def real_constant(token, kind):
    """A single is written as the double of its value."""
    bits = (int(token, 16) if token.startswith("0x")
            else struct.unpack("<Q", struct.pack("<d", float(token)))[0])
    return t.from_bits(real_bits(struct.unpack("<d", struct.pack("<Q", bits))[0], kind))


def real_bits(value, kind):
    """The bits of a number that is one of the type's."""
    to, of = ("<f", "<I") if kind == t.SINGLE else ("<d", "<Q")
    return t.constant(struct.unpack(of, struct.pack(to, value))[0], t.width_of(kind))
