#!/usr/bin/env python3
"""The arithmetic of scripts/peers, on traces made by hand. Usage: peers_test.py PEERS"""
import math, runpy, sys, types

peers = types.SimpleNamespace(**runpy.run_path(sys.argv[1], run_name="peers"))
head = "elapsed_s,clock,error_ns,ordered_ppb,event\n"
rows = peers.rowsOf([head, "1000.0,system,3.0,0.0,\n", "1000.1,system,99.0,0.0,frequency\n", "1000.0,/dev/ptp0,77.0,0.0,\n",
                     "1500.0,system,-4.0,0.0,\n", "2000.0,system,5.0,0.0,\n"])
squares = peers.squaresOf(peers.errorsAt(rows, 500), 500)
assert squares == (25, 2), squares
assert peers.cell([squares, (11, 2)]) == "3.0" and peers.cell([(2e6, 1)]) == "1414"
assert peers.cell([peers.squaresOf(peers.errorsAt(rows[:-1], 500), 500)]) == "ended"

rows = [(1, 0, 7, ""), (1.1, 0, 7, "step"), (2, 0, 7, ""), (2.5, 0, 10, "frequency"), (3, 0, 10, ""), (4, 0, 10, "")]
sums = peers.correctionsAt(rows, 1)
assert sums.keys() == {2, 3, 4} and math.isclose(sums[3] - sums[2], 8.5) and math.isclose(sums[4] - sums[3], 10), sums

free = {0: 0.0, 1: 10.0, 2: 20.0}
for second, gated, last in ((10.0, False, 0.0), (1e6, True, 1.5), (None, False, 1.5)):
    measured = {0: 3.0} if second is None else {0: 3.0, 1: second}
    errors = list(peers.filtered(measured, free, 1, 1e3, 0, gated).values())
    assert all(map(math.isclose, errors[:2], (0, 1.5))) and abs(errors[2] - last) < 1e-9, (second, errors)

# What the covariances of that walk give for the fourth time, from all three measurements at once.
errors = peers.filtered({0: 1.0, 1: -2.0, 2: 5.0}, dict.fromkeys(range(4), 0.0), 2, 4, 3, False)
assert math.isclose(errors[3], 183 / 22), errors
