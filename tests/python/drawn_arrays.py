"""Arrays of all types, shapes and orders, and questions about them, drawn by a `random.Random`.

Hypothesis has such an object too, and finds small examples by it.
"""

import math

import numpy as np

TYPES = [np.dtype(name) for name in "? i1 u1 i2 u2 i4 u4 i8 u8 f2 f4 f8 c8 c16".split()]


# ---- Values

def real_from_bits(dtype, bits):
    return np.array([bits], f"u{dtype.itemsize}").view(dtype)[0]


def interesting_real(rng, dtype):
    """One of the floating-point type, as a scalar of NumPy; NaNs have any bits."""
    width = 8 * dtype.itemsize
    significand = np.finfo(dtype).nmant
    infinity = (1 << (width - 1)) - (1 << significand)
    sign = rng.randrange(2) << (width - 1)
    kind = rng.randrange(10)
    if kind == 0:
        bits = 0
    elif kind == 1:
        bits = infinity
    elif kind == 2:
        bits = infinity + rng.randrange(1, 1 << significand)
    elif kind == 3:
        bits = rng.choice([1, 2, 3, (1 << significand) - 1, 1 << significand, infinity - 1])
    elif kind == 4:
        bits = rng.randrange(infinity)
    else:
        value = rng.choice([1.0, 2.0, 1.5, 0.1, 3.0, 100.0, 2.0**24, 2.0**53, 2.0**62, 1e-5,
                            float(rng.randrange(1, 1000))])
        with np.errstate(over="ignore"):
            bits = int(np.array([value]).astype(dtype).view(f"u{dtype.itemsize}")[0])
    return real_from_bits(dtype, sign | bits)


def neighbour(rng, real):
    """A real some bits away."""
    dtype = real.dtype
    bits = int(np.array([real]).view(f"u{dtype.itemsize}")[0])
    step = rng.choice([1, 1, 2, 3, 1 << rng.randrange(np.finfo(dtype).nmant + 3)])
    return real_from_bits(dtype, (bits + step) % (1 << (8 * dtype.itemsize)))


def real_part_type(dtype):
    return np.dtype(f"f{dtype.itemsize // 2}") if dtype.kind == "c" else dtype


def value(rng, dtype):
    if dtype.kind == "b":
        return dtype.type(rng.randrange(2))
    if dtype.kind in "iu":
        info = np.iinfo(dtype)
        edges = [0, 1, 2, 100, 2**24 + 1, 2**24 - 1, 2**53, 2**53 + 1, 2**53 - 1, 2**62 + 1, -1, -5,
                 -2**53 - 1, info.max, info.max - 1, info.min, info.min + 1]
        chosen = rng.choice([edge for edge in edges if info.min <= edge <= info.max]
                            + [rng.randrange(info.min, info.max + 1)])
        return dtype.type(chosen)
    if dtype.kind == "f":
        return interesting_real(rng, dtype)
    return complex_of(dtype, *(interesting_real(rng, real_part_type(dtype)) for _ in range(2)))


def complex_of(dtype, real, imaginary):
    """With the bits of both parts."""
    parts = np.array([real, imaginary], real_part_type(dtype))
    return parts.view(dtype)[0]


def converted(number, dtype):
    """The same number in another type, or nearly."""
    with np.errstate(all="ignore"):
        real = number.real if dtype.kind != "c" else number
        if dtype.kind in "iu" and real.dtype.kind == "f":
            info = np.iinfo(dtype)
            whole = 0 if math.isnan(real) else max(min(real.item(), 2.0**70), -2.0**70)
            return dtype.type(max(min(int(whole), info.max), info.min))
        return np.array([real]).astype(dtype)[0]


def near(rng, number):
    dtype = number.dtype
    if dtype.kind == "b":
        return ~number
    if dtype.kind in "iu":
        return dtype.type(rng.choice([int(number) ^ 1, int(number)]))
    if dtype.kind == "f":
        return -number if rng.randrange(5) == 0 else neighbour(rng, number)
    parts = [number.real, number.imag]
    part = rng.randrange(2)
    parts[part] = near(rng, parts[part])
    return complex_of(dtype, *parts)


def pair(rng, type1, type2):
    """Of values that are often related."""
    one = value(rng, type1)
    kind = rng.randrange(8)
    if kind < 2:
        return one, value(rng, type2)
    other = one if type1 == type2 else converted(one, type2)
    return one, near(rng, other) if kind < 6 else other


# ---- Shapes and orders

def shape(rng):
    return tuple(rng.choice([1, 2, 3, 4, 5, 0, 7] if rng.randrange(10) == 0 else [1, 2, 3, 4])
                 for _ in range(rng.choice([0, 1, 1, 2, 2, 3, 4, 5])))


def filled(values, shape_, dtype):
    """Without a conversion, which would change bits of NaNs."""
    array = np.empty(len(values), dtype)
    for i, each in enumerate(values):
        array[i] = each
    return array.reshape(shape_)


def arrays(rng, type1, type2, shape_):
    """Two arrays of the shape, in C order."""
    pool = [pair(rng, type1, type2) for _ in range(rng.randrange(1, 7))]
    count = math.prod(shape_)
    chosen = [pool[rng.randrange(len(pool))] for _ in range(min(count, 12))]
    chosen += [pool[(7 * i + i // 5) % len(pool)] for i in range(count - len(chosen))]
    return (filled([one for one, _ in chosen], shape_, type1),
            filled([other for _, other in chosen], shape_, type2))


def with_axes(rng, array):
    order = list(range(array.ndim))
    rng.shuffle(order)
    # The elements' order in memory is that of the permuted axes.
    return array.transpose(order).copy("C").transpose(np.argsort(order).tolist())


def with_gaps(rng, array):
    steps = [rng.choice([1, 1, 2, 3]) * rng.choice([1, -1]) for _ in array.shape]
    room = np.zeros([abs(step) * extent + 1 for step, extent in zip(steps, array.shape)],
                    array.dtype)
    view = room[(*(slice(None, None, step) for step in steps), ...)]
    view = view[(*(slice(extent) for extent in array.shape), ...)]
    view[...] = array
    return view


def unaligned(array):
    room = bytearray(array.nbytes + 1)
    view = np.frombuffer(room, array.dtype, array.size, 1).reshape(array.shape)
    view[...] = array
    return view


def field(array):
    records = np.zeros(array.shape, [("before", "u1"), ("x", array.dtype), ("after", "u2")])
    records["x"] = array
    return records["x"]


def stored(rng, array):
    """The same elements, stored in some other way; axes along which they are equal are
    broadcast."""
    if rng.randrange(3) == 0:
        array = array.astype(array.dtype.newbyteorder())
    kind = rng.randrange(8)
    if kind == 0:
        array = array.copy("F")
    elif kind == 1:
        array = with_axes(rng, array)
    elif kind in (2, 3):
        array = with_gaps(rng, array)
    elif kind == 4 and array.ndim:
        array = unaligned(array)
    elif kind == 5:
        array = field(array)
    if rng.randrange(4) == 0:
        array = array.view()
        array.flags.writeable = False
    return array


def broadcast(rng, array):
    """Repeats one element along some axes, which have the stride 0."""
    part = tuple(slice(1) if rng.randrange(2) and extent else slice(None) for extent in array.shape)
    return np.broadcast_to(array[part], array.shape)


# ---- Questions

TOLERANCES = [0, 0, 0, 1, 2, 3, 10, 15.25, 20, 22, 22.5, 23, 23.5, 24, 24.5, 30.75, 40, 51, 51.25,
              52, 52.5, 53, 60, 0.5, 1e-46, 1e300, math.inf, -1, -0.5, -1e300]
RELATIVES = [1e-9, 1e-3, 2.0**-53, 2.0**-24, 2.0**-20, 0.5, 0.75, 5e-324, 0.9999999999]
ABSOLUTES = [0.0, 1.0, 0.1, 5e-324, 1e-300, 2.0**-24, 2.0**53, 2.0**63, 1e300]


def index_item(rng, extent):
    if extent and rng.randrange(4) == 0:
        return rng.randrange(-extent, extent)
    bounds = [rng.choice([None, rng.randrange(-extent - 2, extent + 3)]) for _ in range(2)]
    return slice(*bounds, rng.choice([None, 1, 2, 3, -1, -2]))


def slices_for(rng, shape_):
    first = rng.randrange(len(shape_) + 1)
    last = rng.randrange(len(shape_) - first + 1)
    items = [index_item(rng, extent) for extent in shape_[:first]]
    if last or rng.randrange(2):
        items.append(Ellipsis)
    items += [index_item(rng, extent) for extent in shape_[len(shape_) - last:]]
    return tuple(items)


def slices_text(items):
    """As talcmp takes them."""
    def text(item):
        if item is Ellipsis:
            return "..."
        if not isinstance(item, slice):
            return str(item)
        bounds = [item.start, item.stop] + ([] if item.step is None else [item.step])
        return ":".join("" if each is None else str(each) for each in bounds)

    return ",".join(map(text, items)) or "..."


def options(rng, shape_):
    """Keyword arguments that make sense for arrays of the shape."""
    chosen = {}
    if rng.randrange(3) == 0:
        chosen["relative"] = rng.choice(RELATIVES)
    else:
        chosen["tol"] = rng.choice(TOLERANCES)
    if rng.randrange(3) == 0:
        chosen["absolute"] = rng.choice(ABSOLUTES)
    for flag in ("equal_nan", "strict_type", "squeeze"):
        if rng.randrange(3) == 0:
            chosen[flag] = True
    if shape_ and rng.randrange(3) == 0:
        chosen["slices"] = slices_for(rng, shape_)
    chosen["max_places"] = rng.choice([1, 2, 5, 1000000])
    return chosen


def mask(rng, shape_):
    bits = rng.choice([0, -1, rng.getrandbits(30)])
    values = [bool(bits >> (i % 30) & 1) for i in range(math.prod(shape_))]
    array = np.array(values, "?").reshape(shape_)
    kind = rng.randrange(3)
    return array if kind == 0 else array.copy("F") if kind == 1 else with_gaps(rng, array)


def with_unit_axes(rng, array):
    """The array with more axes of length 1."""
    for _ in range(rng.randrange(3)):
        array = np.expand_dims(array, rng.randrange(array.ndim + 1))
    return array


def case(rng):
    """Two arrays and the keyword arguments of a call."""
    type1, type2 = rng.choice(TYPES), rng.choice(TYPES)
    if rng.randrange(3) == 0:
        type2 = type1
    shape_ = shape(rng)
    first, second = arrays(rng, type1, type2, shape_)
    if rng.randrange(8) == 0:
        first = broadcast(rng, first)
    else:
        first = stored(rng, first)
    second = stored(rng, second)
    chosen = options(rng, shape_)
    if rng.randrange(3) == 0:
        chosen["ignore"] = mask(rng, shape_)
    if chosen.get("squeeze") and "slices" not in chosen:
        second = with_unit_axes(rng, second)
    elif "slices" not in chosen and rng.randrange(20) == 0:
        second = second[..., :1] if second.ndim else second[None]
    return first, second, chosen
