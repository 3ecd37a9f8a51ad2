#!/usr/bin/python3
"""Proves claims about functions of crypto/ and apk/ for all inputs, with z3 or by trying cases that
stand for all others. Reads the functions from the sources. Fails if a claim does not hold."""
import re
import sys
import tempfile

import z3

from cpp_function import Pointer, Runs, Unread, Word, code, load

HALF = 0xFFFF
LIMB_BITS = 32


def word(name, bits=LIMB_BITS):
    return Word(z3.BitVec(name, bits))


def wide(value):
    """The number, with enough bits for sums of products of two limbs."""
    term = value.term if isinstance(value, Word) else value
    return z3.ZeroExt(72 - term.size(), term)


def always(assumptions, *claims):
    solver = z3.Solver()
    solver.add(*assumptions)
    solver.add(z3.Not(z3.And(*claims)))
    if solver.check() != z3.unsat:
        raise AssertionError(f"the claim does not hold for {solver.model()}")


def is_same(a, b):
    solver = z3.Solver()
    solver.add(a.term != b.term)
    return solver.check() == z3.unsat


def multiply_add_equals_the_wide_product_plus_both_addends():
    s, d, b, c = word("s"), word("d"), word("b"), word("c")
    function = load("crypto/mpi.cpp", "multiply_add", kCount=1, kMpiLimbBits=LIMB_BITS)
    halves = {(x, n): (y >> (16 * n)) & HALF for x, y in (("s", s), ("b", b)) for n in (0, 1)}
    products = {}

    # Replaces the product of a half of s and a half of b by an unknown number. The claim is then
    # proved for each value of this number up to HALF * HALF.
    def product(left, right):
        m = next(n for n in (0, 1) if is_same(left, halves["s", n]))
        n = next(n for n in (0, 1) if is_same(right, halves["b", n]))
        return products.setdefault((m, n), word(f"product{m}{n}"))

    Word.product = product
    place = Pointer(d)
    carry = function(Pointer(s), place, b, c)
    whole = sum((wide(p) << (16 * (m + n)) for (m, n), p in products.items()), wide(c) + wide(d))
    always([z3.ULE(p.term, HALF * HALF) for p in products.values()],
           (wide(carry) << LIMB_BITS) + wide(place[0]) == whole)
    assert len(products) == 4


def half_digit_is_quotient_and_remainder():
    rest, half, d = word("rest"), word("next"), word("d")
    function = load("crypto/mpi.cpp", "half_digit")
    given = [z3.UGE(d.term, 1 << 31), z3.ULT(rest.term, d.term), z3.ULE(half.term, HALF)]
    high, low = d >> 16, d & HALF
    # `estimate` is the quotient of `rest` and `high`, and `left` is the remainder. `taken` is
    # estimate * high, and `to_take` is estimate * low. `rest` is below (2^16 + 2) * high, so
    # `estimate` is below 2^16 + 2. `low` is below 2^16, so `to_take` fits in a limb.
    estimate, left, taken, to_take = word("estimate"), word("left"), word("taken"), word("to_take")
    always(given, z3.UGT(wide(high) * (HALF + 3), wide(rest)))
    given += [z3.ULE(estimate.term, HALF + 2), z3.ULT(left.term, high.term),
              z3.ULE(taken.term, rest.term), rest.term == taken.term + left.term]
    always(given, z3.ULT(wide(estimate) * HALF, 1 << LIMB_BITS))
    given += [z3.ULE(wide(to_take), wide(estimate) * HALF)]

    def quotient(a, b):
        assert is_same(a, rest) and is_same(b, high)
        return estimate

    def product(a, b):
        assert is_same(a, estimate) and (is_same(b, high) or is_same(b, low))
        return taken if is_same(b, high) else to_take

    def run():
        place = Pointer(rest)
        return function(place, half, d), place[0]

    Word.quotient, Word.product = quotient, product
    # The dividend is `rest * 2^16 + half`. If `estimate * d` is subtracted from it, the difference
    # is `left * 2^16 + half - to_take`.
    difference = (wide(left) << 16) + wide(half) - wide(to_take)
    for holds, (digit, remainder) in Runs(run, given):
        less = wide(estimate) - wide(digit)
        given_back = z3.If(less == 0, 0, z3.If(less == 1, wide(d), 2 * wide(d)))
        always(holds, z3.ULE(less, 2), z3.ULT(remainder.term, d.term),
               wide(remainder) == difference + given_back)
    # The dividend is digit * d + remainder, and the remainder is below d. The digit is therefore
    # the quotient. The dividend is below d * 2^16, so the digit fits in half a limb.
    always(given, z3.ULT((wide(rest) << 16) + wide(half), wide(d) << 16))


def eight_bytes_are_plain_text_if_each_is_greater_than_cr():
    eight = word("eight", 64)
    function = load("apk/manifest_mf.cpp", "IsPlainText")
    expected = z3.And(*(z3.UGT(z3.Extract(8 * i + 7, 8 * i, eight.term), ord("\r"))
                        for i in range(8)))
    always([], function(Pointer(eight)).condition == expected)


class Power:
    """A power of some base. Only the exponent is kept. A product of two powers has the sum of their
    exponents."""

    def __init__(self, exponent):
        self.exponent = exponent


class Table:
    """The powers that were computed for a window of w bits."""

    def __init__(self, w):
        self.w = w

    def __getitem__(self, index):
        assert index == 1 or 1 << (self.w - 1) <= index < 1 << self.w, index
        return Power(index)


class Number:
    """A number with exactly the limbs that its value needs."""

    def __init__(self, value):
        self.value = value
        self.p = [value >> i & 0xFFFFFFFF for i in range(0, value.bit_length(), LIMB_BITS)]


class Montgomery:
    @staticmethod
    def multiply(a, b):
        a.exponent += b.exponent


def windows_make_up_the_exponent():
    """Besides the power, `raise` keeps only `nbits` and `wbits` from one exponent bit to the next.
    Both are 0 after every window, and after every zero between windows. The exponents that are
    checked here contain each pair of windows, with and without a zero between the two windows.
    These exponents therefore stand for all exponents. In the shifted exponents, some windows cross
    the border between two limbs."""
    function = load("crypto/mpi_pow_mod.cpp", "raise", kMpiLimbBits=LIMB_BITS,
                    mpi_msb=lambda number: number.value.bit_length())
    for w in (1, 3, 4, 5, 6):
        for value in range(1 << (2 * w + 1)):
            for shift in (0, LIMB_BITS - w):
                power = Power(0)
                function(power, Number(value << shift), Table(w), w, Montgomery)
                assert power.exponent == value << shift, (w, value << shift)


def no_limb_is_held_in_anything_wider():
    for path in ("crypto/mpi.h", "crypto/mpi.cpp", "crypto/mpi_pow_mod.cpp"):
        text = code(path)
        wider = re.findall(r"\bu?int(?:64|_fast|max)\w*|\w*int128\w*|\blong\b|\bdouble\b", text)
        assert not wider, (path, wider)
        lanes = set(re.findall(r"typedef (.*?)\s+lanes\b", text))
        assert lanes <= {"uint32_t"}, (path, lanes)


def line_outside_the_dialect_is_named():
    """A line that the translation does not know must end the proof, and the error must name the
    line."""
    for line in ("const uint16_t cut = static_cast<uint16_t>(a);", "while (a < 3) ++a;", "a = a ? 1 : 2;",
                 "if (a == 1) { return a; } else { a = 2; }", "a = unknown(a);"):
        with tempfile.NamedTemporaryFile("w", suffix=".cpp") as source:
            source.write(f"int f(int a) {{\n  ++a;\n  {line}\n  return a;\n}}\n")
            source.flush()
            try:
                load(source.name, "f")(1)
            except Unread as error:
                assert f"{source.name}:3: `{line}`" in str(error), error
            else:
                raise AssertionError(f"`{line}` was translated without an error")


PROOFS = (line_outside_the_dialect_is_named,
          multiply_add_equals_the_wide_product_plus_both_addends,
          half_digit_is_quotient_and_remainder,
          eight_bytes_are_plain_text_if_each_is_greater_than_cr,
          windows_make_up_the_exponent,
          no_limb_is_held_in_anything_wider)


def main():
    status = 0
    for proof in PROOFS:
        name = proof.__name__.replace("_", " ")
        try:
            proof()
            print(f"proved: {name}", flush=True)
        except Exception as error:  # any error means that the claim is not proved
            print(f"NOT PROVED: {name}: {error!r}", flush=True)
            status = 1
    return status


if __name__ == "__main__":
    sys.exit(main())
