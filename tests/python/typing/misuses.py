"""Calls that mypy has to refuse, each at its line, and by the error that is named there."""

import numpy as np

import talnumericarray as tna

a = np.zeros(3)
tna.same(a)  # [call-arg]
tna.same(a, a, rtol=1e-9)  # [call-arg]
tna.same(a, a, tol="10")  # [arg-type]
tna.same(a, a, 10)  # [misc]
tna.same(first=a, second=a)  # [call-arg]
tna.same(a, a, threads=1.5)  # [arg-type]
tna.same(a, a, slices=1.5)  # [arg-type]
tna.same(a, a, progress=1)  # [arg-type]
tna.equivalent(a, a, tol=1)  # [call-arg]
tna.compare(a, a, rtol=1e-9)  # [call-arg]
tna.compare(a, a, tol="10")  # [arg-type]
tna.compare(a, a, max_places=1.5)  # [arg-type]
tna.compare(a, a, names="ab")  # [arg-type]
tna.compare(a, a, slices=1.5)  # [arg-type]
tna.assert_same(a, a, absolute="x")  # [arg-type]
tna.assert_same(a, a, decimal=6)  # [call-arg]
found = tna.compare(a, a)
found.same = True  # [misc]
found.difference = None  # [misc]
found.places[0].digits = 5  # [misc]
found.smallest_tolerance + 1  # [operator]
found.worst.index  # [union-attr]
found.equal  # [attr-defined]
text: str = tna.same(a, a)  # [assignment]
