"""Reads functions of the tool's C++ sources and runs them in Python.

load() translates the statements of a function into Python. For the arithmetic that is proved here,
C++ and Python look almost the same. A value may be a Word: a term of z3 that stands for every value
of its type. If a branch depends on a comparison of Words, the run splits: there is one run for each
possible answer.

The dialect. A function that is read here may have only these forms:

  declaration  const TYPE name = value;  TYPE name = value;  TYPE name;  TYPE name[n], name[n];
               TYPE is uint32_t, uint64_t, int, bool, auto or lanes, perhaps with *. A narrower type
               would truncate its value, and no proof would notice this. `constexpr` is treated like
               `const`. A typedef is ignored.
  statement    target = value;  or with += -= |= <<= >>= in place of =. The target is name, *name,
               name[i] or name->name.
               ++name;  --name;  memcpy(&to, from, sizeof(to));  continue;  break;  return value;  a call.
  block        if (condition) and for (one; two; three), with a block or one statement. No else,
               while, switch or ?:.
  value        + - * / % << >> & | with a blank on both sides; comparisons, && || !; numbers, 'c',
               true, false; *name, &name in a call, name[i], name->name, calls; static_cast to one of
               the types above. A Word has + - * / << >> & | < and ==.

The translation knows the file's constants that are computed only from numbers. All other constants
must be passed to load(). Comments with // and preprocessor lines are ignored. Any other form ends
the proof with an Unread, which names the line. Then write that line in the dialect, or add its form
here, to the list and to the translation.
"""
import pathlib
import re
import traceback

import z3

ROOT = pathlib.Path(__file__).resolve().parents[2]


class Word:
    """An unsigned number, with some operators of C++. A proof that multiplies or divides Words must
    first set Word.product or Word.quotient."""

    product = quotient = None

    def __init__(self, term):
        self.term = term

    def of_same_type(self, other):
        if isinstance(other, Word):
            return other
        return Word(z3.BitVecVal(int(other), self.term.size()))

    def apply(self, operation, other):
        return Word(operation(self.term, self.of_same_type(other).term))

    def __add__(self, other):
        return self.apply(lambda a, b: a + b, other)

    def __sub__(self, other):
        return self.apply(lambda a, b: a - b, other)

    def __and__(self, other):
        return self.apply(lambda a, b: a & b, other)

    def __or__(self, other):
        return self.apply(lambda a, b: a | b, other)

    def __lshift__(self, other):
        return self.apply(lambda a, b: a << b, other)

    def __rshift__(self, other):
        return self.apply(z3.LShR, other)

    def __mul__(self, other):
        return Word.product(self, self.of_same_type(other))

    def __floordiv__(self, other):
        return Word.quotient(self, self.of_same_type(other))

    def __lt__(self, other):
        return self.compare(z3.ULT, other)

    def __eq__(self, other):
        return self.compare(lambda a, b: a == b, other)

    __radd__ = __add__
    __rmul__ = __mul__

    def compare(self, relation, other):
        condition = relation(self.term, self.of_same_type(other).term)
        one, zero = z3.BitVecVal(1, self.term.size()), z3.BitVecVal(0, self.term.size())
        return Answer(z3.If(condition, one, zero), condition)


class Answer(Word):
    """The result of a comparison: the number 0 or 1. If a branch of the function
    depends on it, the run splits (see Runs)."""

    runs = None

    def __init__(self, term, condition):
        super().__init__(term)
        self.condition = condition

    def __bool__(self):
        return Answer.runs.decide(self.condition)


class Runs:
    """All possible runs of `function` under `assumptions`. The iterator returns the conditions and
    the result of each run."""

    def __init__(self, function, assumptions, most=20):
        self.function, self.assumptions, self.most = function, assumptions, most

    def __iter__(self):
        unexplored = [[]]
        while unexplored:
            self.planned = unexplored.pop()
            self.taken = []
            Answer.runs = self
            result = self.function()
            yield self.assumptions + [c if yes else z3.Not(c) for c, yes in self.taken], result
            for i in range(len(self.planned), len(self.taken)):
                other = [yes for _, yes in self.taken[:i]] + [not self.taken[i][1]]
                if self.possible(self.taken[:i] + [(self.taken[i][0], other[-1])]):
                    unexplored.append(other)

    def decide(self, condition):
        if len(self.taken) == self.most:
            raise AssertionError("the run makes too many decisions, and perhaps does not end")
        if len(self.taken) < len(self.planned):
            yes = self.planned[len(self.taken)]
        else:
            yes = self.possible(self.taken + [(condition, True)])
        self.taken.append((condition, yes))
        return yes

    def possible(self, decisions):
        solver = z3.Solver()
        solver.add(*self.assumptions)
        solver.add(*(c if yes else z3.Not(c) for c, yes in decisions))
        return solver.check() != z3.unsat


class Pointer:
    """Points at one value, or at a few."""

    def __init__(self, *values):
        self.values = list(values)

    def __add__(self, offset):
        return Pointer(*self.values[offset:])

    def __getitem__(self, index):
        return self.values[index]

    def __setitem__(self, index, value):
        self.values[index] = value


class Unread(Exception):
    """A line of the sources that is not in the dialect."""

    def __init__(self, path, line, why):
        text = (ROOT / path).read_text().splitlines()[line - 1].strip()
        super().__init__(f"{path}:{line}: `{text}` is not in the dialect that tests/proofs/cpp_function.py "
                         f"describes ({why}). Write the line in the dialect or add its form there.")


def code(path):
    """The source file without comments that begin with //, and without preprocessor lines."""
    return re.sub(r"//[^\n]*|^#[^\n]*", "", (ROOT / path).read_text(), flags=re.M)


def load(path, name, **constants):
    """Returns the function `name` of the source file, as a Python function. This function knows the
    names in `constants`, and the file's constants that are computed only from numbers."""
    text = code(path)
    scope = {"Pointer": Pointer, **constants}
    for constant, value in re.findall(r"constexpr \w+ (k\w+) = ([^;{}]+);\n", text):
        try:
            scope[constant] = eval(expression(value), scope)
        except (NameError, SyntaxError):
            pass  # not computed only from numbers
    found = re.search(r"^(?!\s)[^\n;{}]*?\b%s\(([^;{}]*)\) \{\n(.*?)^\}" % name, text, re.S | re.M)
    if not found:
        raise AssertionError(f"{path} has no function {name}: tell tests/proofs/prove.py its new name or file")
    parameters = [re.search(r"(\w+)$", word.strip())[1] for word in found[1].split(",")]
    first = text[:found.start(2)].count("\n") + 1
    lines, places = [f"def function({', '.join(parameters)}):"], [first - 1]
    for place, line in statements(found[2], path, first):
        lines.append(line)
        places.append(place)
    name = f"{path}, {name}"
    try:
        exec(compile("\n".join(lines), name, "exec"), scope)
    except SyntaxError as error:
        raise Unread(path, places[error.lineno - 1], error) from error

    def run(*arguments):
        try:
            return scope["function"](*arguments)
        except (ArithmeticError, AttributeError, LookupError, NameError, TypeError, z3.Z3Exception) as error:
            steps = traceback.extract_tb(error.__traceback__)
            inside = [step.lineno for step in steps if step.filename == name]
            raise Unread(path, places[inside[-1] - 1], error) from error

    return run


TYPE_NAME = r"(?:uint32_t|uint64_t|int|bool|auto|lanes)"
TYPE = rf"(?:const )?{TYPE_NAME}\b ?\*?"


def statements(body, path, first):
    """Yields the lines of a function's body in Python, indented by one space per block. Each line
    comes with its statement's line number in the source file. The body begins at the line `first`
    of the source file."""
    body = re.sub(r"\bif \((.*)\) (\w[^{;]*;)", r"if (\1) {\2}", body)
    body = re.sub(r"\b(for \(.*?;.*?;.*?\)) ([\w*][^{;]*;)", r"\1 {\2}", body)
    steps = []
    token = re.compile(r"\s*(for \(.*?;.*?;.*?\) \{|if \(.*?\) \{|\}|[^;{}]+;)", re.S)
    position, end = 0, len(body.rstrip())
    while position < end:
        match = token.match(body, position)
        place = first + body[:match.start(1) if match else position + 1].count("\n")
        if not match:
            raise Unread(path, place, "no statement is found here")
        position = match.end()
        text, lines = " ".join(match[1].split()), []
        depth = " " * (len(steps) + 1)
        if text.startswith("for ("):
            start, condition, step = text[len("for ("):-len(") {")].split("; ")
            lines += [depth + simple(start), f"{depth}while {expression(condition)}:"]
            steps.append(simple(step))
        elif text.startswith("if ("):
            lines.append(f"{depth}if {expression(text[len('if ('):-len(') {')])}:")
            steps.append(None)
        elif text == "}":
            step = steps.pop()
            if step:
                lines.append(depth + step)
        elif text == "continue;":
            lines += [depth + next(s for s in reversed(steps) if s), depth + "continue"]
        else:
            lines.append(depth + simple(text[:-1]))
        yield from ((place, line) for line in lines)


def simple(text):
    """Translates a statement that has no block."""
    text = re.sub(r"^constexpr ", "const ", text)
    copied = re.match(r"memcpy\((&?)(\w+), (.*), sizeof\(\w+\)\)$", text)
    if copied:
        source = copied[3].removeprefix("&")
        is_one = copied[1] and not copied[3].startswith("&")
        return (f"{copied[2]} = ({source})[0]" if is_one else f"{copied[2]} = Pointer({source})")
    if re.match(r"typedef |%s[\w\[\], ]+$" % TYPE, text):
        return "pass"
    text = re.sub("^" + TYPE + r"(?=\w+ =)", "", text)
    if text.startswith("return "):
        return "return " + expression(text[len("return "):])
    counted = re.match(r"(\+\+|--)(\w+)$", text)
    if counted:
        return f"{counted[2]} {counted[1][0]}= 1"
    target, assigned, value = re.match(r"(.*?)( [-+|<>]*= |$)(.*)", text).groups()
    return expression(target) + assigned + expression(value)


def expression(text):
    text = re.sub(rf"static_cast<{TYPE_NAME}>", "", text)
    text = re.sub(r"(?<![\w)\]] )(?<![\w)\]])\*(\w+)", r"\1[0]", text)  # what a pointer points at
    text = re.sub(r"&(\w+)(?=[,)\[])", r"\1", text)  # an address that is passed to a call
    for cpp, python in (("->", "."), ("std::", ""), ("&&", " and "), ("||", " or "),
                        (" / ", " // "), ("false", "False"), ("true", "True")):
        text = text.replace(cpp, python)
    text = re.sub(r"!(?!=)", " not ", text)
    text = re.sub(r"\b(0[xX][0-9A-Fa-f]+|\d+)[uUlL]+\b", r"\1", text)
    return re.sub(r"'(\\?.)'", lambda match: f"ord('{match[1]}')", text).strip()
