"""What is claimed of each function of code.cpp: that it equals a formula, for all bits of all inputs.

The formulas are the rule (rule.smt2) and the test for certainty (certainty.smt2); integers, and the
conversion of elements, are stated here in terms of SMT-LIB. Operations that both sides apply to the
same numbers need no meaning: then a claim holds for any arithmetic. Where code makes a conversion of
sums, these have the meaning of IEEE 754 in a direction of rounding that is an input too.
"""

import functools
import itertools
import pathlib
import re
import string

import terms as t
import translate

FORMULAS = pathlib.Path(__file__).parent / "formulas"

# ---- Types of elements, by their names in C++

INTEGERS = {
    "signed char": (True, 8), "short": (True, 16), "int": (True, 32), "long": (True, 64),
    "long long": (True, 64), "unsigned char": (False, 8), "unsigned short": (False, 16),
    "unsigned int": (False, 32), "unsigned long": (False, 64), "unsigned long long": (False, 64),
}
REALS = {"float": t.SINGLE, "double": t.DOUBLE}
COMPLEX = {"std::complex<float>": "float", "std::complex<double>": "double"}


def part_type(name):
    return COMPLEX.get(name, name)


def parts_of(name):
    return 2 if name in COMPLEX else 1


def width_of(name):
    part = part_type(name)
    return INTEGERS[part][1] if part in INTEGERS else t.width_of(REALS[part])


def comparison_type(*names):
    """The real type in which these are compared; None for integers."""
    found = [part_type(name) for name in names]
    return "double" if "double" in found else "float" if "float" in found else None


def values_of_type(name):
    """What the files of formulas say with a "$" in them."""
    _, exponent_bits, significand_bits = REALS[name]
    return {
        "exponent_bits": exponent_bits, "significand_bits": significand_bits,
        "width": exponent_bits + significand_bits,
        "eight_epsilon": f"(/ 1.0 {2 ** (significand_bits - 4)}.0)",
    }


def converted(part, name, bits):
    """An element's part as a real of the type of comparison; the text of a term."""
    if name == part:
        return f"(real {bits})"
    sort = f"{REALS[name][1]} {REALS[name][2]}"
    if part in INTEGERS:
        op = "to_fp" if INTEGERS[part][0] else "to_fp_unsigned"
        return f"((_ {op} {sort}) $direction {bits})"
    own = f"((_ to_fp {REALS[part][1]} {REALS[part][2]}) {bits})"
    return f"((_ to_fp {sort}) $direction {own})"


def number(name, bits):
    """An integer in more digits than any needs."""
    is_signed, width = INTEGERS[name]
    return f"((_ {'sign' if is_signed else 'zero'}_extend {72 - width}) {bits})"


# ---- Claims


class Claim:
    """That a statement holds, in which terms of the code have names."""

    def __init__(self, function, statement, code, inputs, real=None, sums=False):
        self.function, self.statement, self.code = function, statement, code
        self.inputs, self.real, self.sums = inputs, real, sums

    @property
    def assumes(self):
        """Whether it would hold of nothing if what it assumes were never so."""
        return self.statement.startswith("(=>")

    def under(self, condition):
        """The same where a condition on the inputs holds."""
        if condition is t.TRUE:
            return self
        inputs = {**self.inputs, **{part.arguments[0]: part.sort for part in t.all_terms([condition])
                                    if part.op == "variable"}}
        return Claim(self.function, f"(=> assumed {self.statement})",
                     {**self.code, "assumed": condition}, inputs, self.real, self.sums)

    def query(self, exactly=None, wanted="(not {})", values=False):
        """What to ask the solver; `exactly` is a direction in which all arithmetic is IEEE 754's."""
        direction = exactly or "direction"
        printer = t.Printer(direction, swaps=not exactly)
        lines = ["(set-option :produce-models true)"] if values else []
        lines.append("(set-logic ALL)")
        if not exactly:
            lines.append("(declare-const direction RoundingMode)")
        if self.real:
            arithmetic = ("arithmetic" if exactly else
                          "sums_arithmetic" if self.sums else "any_arithmetic")
            lines += [formulas(name) for name in ("real_type", arithmetic, "rule", "certainty")]
            # Functions of the C library.
            lines += ["(declare-fun power (T T) T)", "(declare-fun shifted (T (_ BitVec 32)) T)"]
        for name, sort in self.inputs.items():
            printer.name(t.variable(name, sort))
        names = {name: printer.name(term) for name, term in self.code.items()}
        lines += printer.lines
        lines += [f"(define-fun {name} () {t.sort_text(term.sort)} {names[name]})"
                  for name, term in self.code.items()]
        lines.append(f"(assert {wanted.format(self.statement)})")
        lines.append("(check-sat)")
        if values:
            lines.append(f"(get-value ({' '.join(self.inputs)}))")
        known = {"direction": direction}
        if self.real:
            known.update(values_of_type(self.real))
        return string.Template("\n".join(lines)).substitute(known) + "\n"


def formulas(name):
    return re.sub(r"^;.*\n", "", (FORMULAS / f"{name}.smt2").read_text(), flags=re.MULTILINE)


def real_variable(name, kind):
    return t.from_bits(t.variable(name, t.bits(t.width_of(REALS[kind]))))


# ---- The remembered factor

CACHE = "factor_cache_of_thread"


def cache_inputs(kind):
    width = t.width_of(REALS[kind])
    names = [f"{name}{slot}" for slot in range(4) for name in ("lasttol", "factor")]
    return {"state": t.bits(32), **{name: t.bits(width) for name in names}}


def cache_memory(kind):
    inputs = cache_inputs(kind)
    size = t.width_of(REALS[kind]) // 8
    variables = [t.variable(name, sort) for name, sort in inputs.items()]
    cells = {0: variables[0]}
    for k, cell in enumerate(variables[1:]):
        cells[(k + 1) * size] = cell
    return translate.Memory("cache", cells)


def of_slot(name):
    """The text of what the slot in use holds."""
    slot = "((_ extract 2 1) state)"
    found = f"{name}3"
    for k in (2, 1, 0):
        found = f"(ite (= {slot} (_ bv{k} 2)) {name}{k} {found})"
    return f"(real {found})"


def remembered(tol, again="state"):
    """Whether the factor is: in the slot in use, which nobody writes, and still in use after."""
    return (f"(and (fp.eq {tol} {of_slot('lasttol')})"
            f" (= {again} (bvand state #xfffffffe)))")


# ---- Functions


class Functions:
    """The functions of one module, by their names without what is around them."""

    def __init__(self, module, names, platform="x86-64"):
        self.module = module
        self.names = names
        self.platform = platform
        self.used = translate.collections.Counter()

    def translated(self, name, arguments, memory, real=None, interrupted=False):
        """The outcome of a call, with `defined`: that nothing on the way is undefined."""
        translation = translate.Translation(self.module, self.handlers(real))
        translation.interrupted = interrupted
        translation.globals = {CACHE + ("If" if real == "float" else "Id"): "cache"}
        if real:
            memory = {**memory, "cache": cache_memory(real)}
        # On ARM a parameter of an empty class is passed, as anything.
        kinds = self.module.function(self.names[name]).kinds
        empty = [translation.fresh(kind) for kind in kinds[:len(kinds) - len(arguments)]]
        outcome = translation.outcome(self.names[name], [*empty, *arguments], memory)
        outcome["defined"] = t.conjunction(*translation.always)
        self.used.update(translation.used)
        return outcome

    @staticmethod
    def handlers(real):
        def new_factor(path, tol):
            """Gives the factor, which is remembered from then on, in some slot."""
            path.done["made"] = t.TRUE
            path.done["made_for"] = tol
            made = real_variable("made_factor", real)
            memory = path.memory["cache"]
            size = t.width_of(REALS[real]) // 8
            memory.cells[0] = t.concat(t.variable("state_after", t.bits(31)), t.constant(0, 1))
            for slot in range(4):
                memory.cells[(2 * slot + 1) * size] = t.bits_of(tol)
                memory.cells[(2 * slot + 2) * size] = t.bits_of(made)
            return made

        def modf(path, tol, pointer):
            """Gives the fraction, and stores the whole number."""
            path.done["split"] = t.bits_of(tol)
            whole = real_variable("whole", real)
            path.memory[pointer.object].store(t.value_of(pointer.offset), t.bits_of(whole))
            return real_variable("fraction", real)

        def pow_(path, base, exponent):
            del path
            return t.Term("power", [base, exponent], base.sort)

        def ldexp(path, number_, shift):
            del path
            return t.Term("shifted", [number_, shift], number_.sort)

        return {"new_factor": new_factor, "modf": modf, "pow": pow_, "ldexp": ldexp}


# ---- What each function is claimed to be


def arguments_in_memory(x_count, x_name, y_count, y_name):
    memory = {
        "x": translate.array_memory("x", width_of(x_name), x_count * parts_of(x_name)),
        "y": translate.array_memory("y", width_of(y_name), y_count * parts_of(y_name)),
    }
    pointers = [translate.Pointer(name, t.constant(0, 64)) for name in ("x", "y")]
    inputs = {cell.arguments[0]: cell.sort for m in memory.values() for cell in m.cells.values()}
    return memory, pointers, inputs


def claims_of(functions, name):
    kind, _, rest = name.partition("<")
    return OF_KIND[kind](functions, name, template_arguments(rest[:-1]))


def template_arguments(text):
    found, depth, start = [], 0, 0
    for position, letter in enumerate(text + ","):
        depth += {"<": 1, ">": -1}.get(letter, 0)
        if letter == "," and depth == 0:
            found.append(text[start:position].strip())
            start = position + 1
    return found


def of_compare_reals(functions, name, arguments):
    kind, = arguments
    inputs = {**dict.fromkeys(("tol", "x", "y", "made_factor"), t.bits(t.width_of(REALS[kind]))),
              **cache_inputs(kind), "state_read_2": t.bits(32)}
    outcome = functions.translated(name, [real_variable(v, kind) for v in ("tol", "x", "y")], {},
                                   real=kind, interrupted=True)
    is_remembered = remembered("(real tol)", "state_read_2")
    factor = f"(ite {is_remembered} {of_slot('factor')} (real made_factor))"
    verdict = ("((_ sign_extend 24) (compare_impl (real tol)"
               f" {factor} {is_remembered} (real x) (real y)))")
    made = f"(makes_factor (real tol) {is_remembered} (real x) (real y))"
    return [
        Claim(name, f"(= code {verdict})", {"code": outcome["result"]}, inputs, kind),
        Claim(name, f"(= made {made})", {"made": outcome["made"]}, inputs, kind),
        Claim(name, "(=> made (= made_for (real tol)))",
              {"made": outcome["made"], "made_for": outcome["made_for"]}, inputs, kind),
        *defined(name, outcome, inputs, kind),
    ]


def defined(name, outcome, inputs, kind=None):
    if outcome["defined"] is t.TRUE:
        return []
    return [Claim(name, "defined", {"defined": outcome["defined"]}, inputs, kind)]


def of_compare_integers(functions, name, arguments):
    inputs = {v: t.bits(width_of(kind)) for v, kind in zip("xy", arguments)}
    outcome = functions.translated(name, [t.variable(v, sort) for v, sort in inputs.items()], {})
    x, y = (number(kind, v) for v, kind in zip("xy", arguments))
    verdict = f"(ite (= {x} {y}) (_ bv0 32) (ite (bvslt {x} {y}) #xffffffff #x00000001))"
    return [Claim(name, f"(= code {verdict})", {"code": outcome["result"]}, inputs),
            *defined(name, outcome, inputs)]


def of_same(functions, name, arguments):
    """The parts one after the other; the first may have made the factor that the second uses."""
    x_name, y_name = arguments
    real = comparison_type(*arguments)
    memory, pointers, inputs = arguments_in_memory(1, x_name, 1, y_name)
    inputs["tol"] = t.bits(64)
    tol = "((_ to_fp 11 53) tol)"
    if real:
        width = t.width_of(REALS[real])
        inputs.update(cache_inputs(real), made_factor=t.bits(width))
        tol = tol if real == "double" else f"((_ to_fp 8 24) $direction {tol})"
    outcome = functions.translated(name, [real_variable("tol", "double"), *pointers], memory, real)
    both = parts_of(x_name) + parts_of(y_name) == 4
    statements = []
    for part in range(max(parts_of(x_name), parts_of(y_name))):
        if part == 1 and not both:
            imaginary, kind = ("x1", x_name) if x_name in COMPLEX else ("y1", y_name)
            sort = REALS[part_type(kind)]
            statements.append(f"(fp.isZero ((_ to_fp {sort[1]} {sort[2]}) {imaginary}))")
        elif real:
            statements.append(same_reals(real, tol, part, x_name, y_name))
        else:
            statements.append(f"(= {number(x_name, 'x0')} {number(y_name, 'y0')})")
    statement = f"(= code (and true {' '.join(statements)}))"
    return [Claim(name, statement, {"code": outcome["result"]}, inputs, real),
            *defined(name, outcome, inputs, real)]


def same_reals(real, tol, part, x_name, y_name):
    def elements(k):
        return (f"{converted(part_type(x_name), real, f'x{k}')}"
                f" {converted(part_type(y_name), real, f'y{k}')}")

    is_remembered = remembered(tol)
    factor = f"(ite {is_remembered} {of_slot('factor')} (real made_factor))"
    if part == 1:
        made = f"(makes_factor {tol} {is_remembered} {elements(0)})"
        is_remembered = f"(or {is_remembered} (and {made} (not (fp.isNaN {tol}))))"
    return f"(= (compare_impl {tol} {factor} {is_remembered} {elements(part)}) the_same)"


def bound_arguments(bound):
    """The first argument of a test, if it has one."""
    if bound == "equal":
        return [], {}
    return [real_variable("divisor", bound)], {"divisor": t.bits(t.width_of(REALS[bound]))}


def of_certain(functions, name, arguments):
    """As a block of one lane, but an imaginary part is compared with zero."""
    return of_lanes(functions, name, arguments, elements=1, fused=False, is_block=False)


def of_divisor(functions, name, arguments):
    kind, = arguments
    inputs = {"tol": t.bits(t.width_of(REALS[kind])), "control_word": t.bits(32),
              **cache_inputs(kind), "state_read_2": t.bits(32)}
    outcome = functions.translated(name, [real_variable("tol", kind)], {}, kind, interrupted=True)
    # Subnormal results are flushed, but subnormal operands are not taken for zero.
    flushes = ("(= (bvand control_word #x00008040) #x00008000)" if functions.platform == "x86-64"
               else "false")
    factor = of_slot("factor")
    tol = "(real tol)"
    statement = (
        f"(ite (or (not (fp.gt {tol} zero)) {flushes}) zero (ite (fp.geq {tol} bits) one"
        f" (ite {remembered(tol, 'state_read_2')} (certain_divisor {factor}) zero)))")
    return [Claim(name, f"(= code {statement})", {"code": outcome["result"]}, inputs, kind),
            *defined(name, outcome, inputs, kind)]


def of_factor(functions, name, arguments):
    """Of functions of the C library only what they are called with is known."""
    kind, = arguments
    width = t.bits(t.width_of(REALS[kind]))
    inputs = dict.fromkeys(("tol", "whole", "fraction"), width)
    outcome = functions.translated(name, [real_variable("tol", kind)], {}, kind)
    return [Claim(name, f"(= code {factor_formula(kind)})", {"code": outcome["result"]}, inputs, kind),
            Claim(name, "(= split tol)", {"split": outcome["split"]}, inputs, kind),
            *defined(name, outcome, inputs, kind)]


def factor_formula(kind):
    """2^(tol - bits), of the whole number and the fraction of a tolerance; a whole number beyond 2^20
    counts as that."""
    limit = f"((_ to_fp {REALS[kind][1]} {REALS[kind][2]}) RNE 1048576.0)"
    whole = (f"(ite (fp.lt (real whole) {limit})"
             f" (ite (fp.gt (real whole) (fp.neg {limit})) (real whole) (fp.neg {limit})) {limit})")
    shift = f"(bvsub ((_ fp.to_sbv 32) RTZ {whole}) (_ bv{REALS[kind][2]} 32))"
    power = "(ite (fp.isZero (real fraction)) one (power (fp.add RNE one one) (real fraction)))"
    return f"(shifted {power} {shift})"


def of_remember(functions, name, arguments):
    """If no handler comes between: the slot in use, or the next one if that is being written, has the
    tolerance and the factor, the others what they had, and the count is one more."""
    kind, = arguments
    width = t.bits(t.width_of(REALS[kind]))
    inputs = {**dict.fromkeys(("tol", "made_factor"), width), **cache_inputs(kind)}
    outcome = functions.translated(name, [real_variable(v, kind) for v in inputs if v in (
        "tol", "made_factor")], {}, kind)
    return [*cache_claims(name, outcome, "made_factor", inputs, kind),
            *defined(name, outcome, inputs, kind)]


def of_new_factor(functions, name, arguments):
    """It gives the factor, and remembers it as `remember` does."""
    kind, = arguments
    width = t.bits(t.width_of(REALS[kind]))
    inputs = {**dict.fromkeys(("tol", "whole", "fraction"), width), **cache_inputs(kind)}
    outcome = functions.translated(name, [real_variable("tol", kind)], {}, kind)
    return [Claim(name, f"(= code {factor_formula(kind)})", {"code": outcome["result"]}, inputs, kind),
            Claim(name, "(= split tol)", {"split": outcome["split"]}, inputs, kind),
            *cache_claims(name, outcome, factor_formula(kind), inputs, kind),
            *defined(name, outcome, inputs, kind)]


def cache_claims(name, outcome, factor, inputs, kind):
    """What is in memory afterwards; `factor` is an input or a formula."""
    size = t.width_of(REALS[kind]) // 8
    after = {"state_after": outcome["cache_0"]}
    for slot in range(4):
        after[f"lasttol_after{slot}"] = outcome[f"cache_{(2 * slot + 1) * size}"]
        after[f"factor_after{slot}"] = outcome[f"cache_{(2 * slot + 2) * size}"]
    factor = f"(real {factor})" if factor in inputs else factor
    used = "(bvadd ((_ extract 2 1) state) (concat #b0 ((_ extract 0 0) state)))"
    slots = " ".join(
        f"(ite (= {used} (_ bv{slot} 2))"
        f" (and (= lasttol_after{slot} tol) (= (real factor_after{slot}) {factor}))"
        f" (and (= lasttol_after{slot} lasttol{slot}) (= factor_after{slot} factor{slot})))"
        for slot in range(4))
    state = (f"(= state_after (concat (bvadd ((_ extract 31 3) state) (_ bv1 29)) {used} #b0))")
    return [Claim(name, f"(and {state} {slots})", after, inputs, kind)]


def of_element_type(functions, name, arguments):
    del arguments
    inputs = {"id": t.bits(32)}
    outcome = functions.translated(name, [t.variable("id", t.bits(32))], {})
    known = "(and (bvsge id #x00000001) (bvsle id #x0000000c))"
    return [Claim(name, f"(= code (ite {known} id #x00000000))", {"code": outcome["result"]}, inputs),
            *defined(name, outcome, inputs)]


# ---- Blocks

BYTES = {"avx512": 64, "avx2": 32, "baseline": 16}


def of_block(functions, name, arguments):
    """Every lane is the test of its pair, and the block all of them: none is lost."""
    set_name, vectors, *rest = arguments
    _, x_name, y_name = rest
    real = comparison_type(x_name, y_name)
    lane_bytes = (t.width_of(REALS[real]) if real else max(width_of(x_name), width_of(y_name))) // 8
    elements = BYTES[set_name] // lane_bytes // parts_of(y_name) * int(vectors.rstrip("ul"))
    return of_lanes(functions, name, rest, elements, fused=set_name != "baseline", is_block=True)


def of_short_prefix(functions, name, arguments):
    """All of so many elements are passed over if all are certainly the same, else none."""
    length, *rest = arguments
    return of_lanes(functions, name, rest, int(length.rstrip("ul")), fused=False, is_block=True)


def all_or_none(result, elements):
    """The condition on which a result is the number of elements, and else 0; None if it always is 0,
    which passes nothing over."""
    if result.sort == t.BOOL:
        return result
    width = result.sort[1]
    if result is t.constant(0, width):
        return None
    count, none = t.constant(elements, width), t.constant(0, width)
    if result.op == "ite" and result.arguments[1:] == (count, none):
        return result.arguments[0]
    raise translate.Unknown(f"a result that is neither {elements} nor 0")


def of_lanes(functions, name, arguments, elements, fused, is_block):
    bound, x_name, y_name = arguments
    memory, pointers, inputs = arguments_in_memory(elements, x_name, elements, y_name)
    divisor, more = bound_arguments(bound)
    outcome = functions.translated(name, [*divisor, *pointers], memory)
    claims = defined(name, outcome, {**inputs, **more}, comparison_type(x_name, y_name))
    by_bits = is_block and functions.platform == "arm"
    condition = all_or_none(outcome["result"], elements)
    if condition is None:
        return claims
    for assumed, result in cases(condition):
        try:
            lanes = by_lane(result, x_name, y_name)
        except translate.Unknown:
            if comparison_type(x_name, y_name):
                raise
            return [*claims, of_integers(name, result, elements, (x_name, y_name), inputs)]
        for lane in itertools.product(range(elements), range(parts_of(y_name))):
            formula = functools.partial(lane_formula, bound, fused, by_bits, lane[1] and not is_block)
            term = lanes.get(lane, t.TRUE)
            claims += [claim.under(assumed)
                       for claim in of_lane(name, term, lane, (x_name, y_name), formula, more)]
        if None in lanes:
            # Lanes that are not in use are zeros.
            formula = lane_formula(bound, fused, by_bits, False, "zero", "zero")
            claims.append(Claim(name, f"(= code {formula})", {"code": lanes[None]}, more,
                                comparison_type(x_name, y_name), sums=True))
    return claims


def cases(result):
    """The ways in which an integer is converted, each with its condition and the answer then."""
    if result.op == "ite" and variables(result.arguments[0]) == {"x0"}:
        condition, yes, no = result.arguments
        return [(t.conjunction(condition if way is yes else t.negation(condition), inner), found)
                for way in (yes, no) for inner, found in cases(way)]
    return [(t.TRUE, result)]


def of_integers(name, term, elements, pair, inputs):
    """All lanes at once: a compiler may have joined the bits of several."""
    equal = " ".join(f"(= {number(pair[0], f'x{k}')} {number(pair[1], f'y{k}')})"
                     for k in range(elements))
    return Claim(name, f"(= code (and true {equal}))", {"code": term}, inputs)


def lane_formula(bound, fused, by_bits, is_zero, x, y):
    """Whether a lane is certainly the same, of two texts of terms."""
    if is_zero:
        return f"(fp.isZero {y})"
    if by_bits:
        return f"(and (= {x} {y}) (finite {y}))"
    if bound == "equal":
        return f"(fp.eq {x} {y})"
    return f"(certain {str(fused).lower()} (real divisor) {x} {y})"


def by_lane(result, x_name, y_name):
    """The parts of a conjunction, gathered by the pair of parts that they are about."""
    found = {}
    for part in result.arguments if result.op == "and" else [result]:
        places = {place_of(term.arguments[0], x_name, y_name) for term in t.all_terms([part])
                  if term.op == "variable" and term.arguments[0][0] in "xy"}
        # The second part of a complex number is compared with no part of a real.
        if len({element for element, _ in places}) > 1:
            raise translate.Unknown(f"a part of the answer is about lanes {sorted(places)}")
        place = max(places, default=None)
        found[place] = t.conjunction(found.get(place, t.TRUE), part)
    return found


def place_of(variable, x_name, y_name):
    """The element, and the part of a complex number."""
    count = parts_of(x_name if variable[0] == "x" else y_name)
    return divmod(int(variable[1:]), count)


def of_lane(name, term, lane, pair, formula, more):
    """What is claimed of one lane: a part of an element, or of a pair of them."""
    element, part = lane
    x_name, y_name = pair
    real = comparison_type(*pair)
    # The inputs are renamed to those of the first lane, so that like lanes make the same claim.
    y_place = element * parts_of(y_name) + part
    term = replaced(term, {f"x{element}": "x0", f"y{y_place}": "y0"})
    inputs = {"x0": t.bits(width_of(x_name)), "y0": t.bits(width_of(y_name)), **more}
    if not real:
        statement = f"(= {number(x_name, 'x0')} {number(y_name, 'y0')})"
        return [Claim(name, f"(= code {statement})", {"code": term}, inputs)]
    x = "zero" if part else converted(part_type(x_name), real, "x0")
    y = converted(part_type(y_name), real, "y0")
    if x_name in INTEGERS and not part:
        return of_lane_with_conversion(name, term, x, y, formula, inputs, real)
    return [Claim(name, f"(= code {formula(x, y)})", {"code": term}, inputs, real)]


def of_lane_with_conversion(name, term, x, y, formula, inputs, real):
    """In two steps: the integer is converted to an equal number, perhaps a zero of another sign; and
    the lane is the test of any number that equals the first."""
    conversions = outermost(term, lambda part: part.sort == REALS[real] and variables(part) == {"x0"})
    if len(conversions) != 1:
        return [Claim(name, f"(= code {formula(x, y)})", {"code": term}, inputs, real, sums=True)]
    conversion = conversions[0]
    width = t.bits(t.width_of(REALS[real]))
    rest = replaced(term, {conversion: t.from_bits(t.variable("converted", width))})
    known = {name: sort for name, sort in inputs.items() if name != "x0"}
    pair = formula("(real number)", y)
    return [
        Claim(name, f"(fp.eq conversion {x})", {"conversion": conversion}, {"x0": inputs["x0"]}, real,
              sums=True),
        # zeros.smt2 proves of equal numbers that their distances from a third are equal.
        Claim(name, "(=> (and (fp.eq (real converted) (real number))"
                    f" (= (difference (real converted) {y}) (difference (real number) {y})))"
                    f" (= code {pair}))",
              {"code": rest}, {**known, "converted": width, "number": width}, real),
    ]


def variables(term):
    return {part.arguments[0] for part in t.all_terms([term]) if part.op == "variable"}


def outermost(term, is_wanted):
    """The terms in this one that are wanted and are not within another that is."""
    if is_wanted(term):
        return [term]
    found = {}
    for argument in term.arguments:
        if isinstance(argument, t.Term):
            found.update(dict.fromkeys(outermost(argument, is_wanted)))
    return list(found)


def replaced(term, replacements):
    """The term with other variables, by name, or with other terms in place of some."""
    found = {}
    for part in t.all_terms([term]):
        if part in replacements:
            found[part] = replacements[part]
        elif part.op == "variable":
            name = part.arguments[0]
            found[part] = t.variable(replacements.get(name, name), part.sort)
        else:
            found[part] = t.Term(part.op, [found.get(a, a) if isinstance(a, t.Term) else a
                                           for a in part.arguments], part.sort)
    return found[term]


OF_KIND = {
    "compare_reals": of_compare_reals, "compare_integers": of_compare_integers, "same": of_same,
    "certain": of_certain, "divisor_of": of_divisor, "element_type": of_element_type,
    "factor_of": of_factor, "new_factor": of_new_factor, "remember": of_remember,
    "block": of_block, "short_prefix": of_short_prefix,
}
