"""Mutations of single lines of C++ that clang-format has laid out, for tests/mutate."""

import re

LITERAL_OR_COMMENT = re.compile(r"""("(?:[^"\\]|\\.)*"|'(?:[^'\\]|\\.)*')|//.*""")
NOT_CODE = re.compile(r"\s*(#|using |namespace|static_assert|template|$)")
OPERATOR = re.compile(r"(?<= )(==|!=|<=|>=|<|>|&&|\|\|)(?= |$)|\b(true|false|continue)\b|!(?=[\w(])")
SWAPPED = {"==": "!=", "!=": "==", "<": "<=", "<=": "<", ">": ">=", ">=": ">", "&&": "||", "||": "&&",
           "true": "false", "false": "true", "continue": "break", "!": ""}
INTEGER = re.compile(r"(?<![\w.'])(?<!\) = )\d+(?![\w.'])")  # except the 0 of a pure virtual function
KEY = re.compile(r'"([^"\s%]+)"')  # log texts contain spaces or conversions
CALL_OR_ASSIGNMENT = re.compile(r"\s+([a-z_]|[A-Z]\w*::)([^\s=(]*\(.*\)|[^\s=(]* [-+|&]?= .*);$|\s+(\+\+|--)\w+;$")
RETURN = re.compile(r"\breturn ([^;]+);")
BOOLEAN_FUNCTION = re.compile(r"\s*(\[\[nodiscard\]\] |static |inline |constexpr )*bool [\w:]+\(.*[^;]$")


def without_comment(line: str) -> str:
    """Removes the comment and the space before it.

    >>> without_comment('f("//");  // g')
    'f("//");'
    """
    return LITERAL_OR_COMMENT.sub(lambda found: found[1] or "", line).rstrip()


def masked(line: str) -> str:
    """Replaces literals with characters that no mutation matches; positions stay the same.

    >>> masked('f("a < b", c);')
    'f(@@@@@@@, c);'
    """
    return LITERAL_OR_COMMENT.sub(lambda found: "@" * len(found[0]), line)


def condition_of_if(code: str) -> tuple[int, int] | None:
    """Returns where the condition in `code` begins and ends; None if it is incomplete or declares a variable."""
    if not (found := re.search(r"\bif \(", code)):
        return None
    depth = 1
    for end in range(found.end(), len(code)):
        depth += {"(": 1, ")": -1}.get(code[end], 0)
        if depth == 0:
            begin = max(found.end(), code.rfind("; ", 0, end) + 2)
            return None if " = " in code[begin:end] else (begin, end)
    return None


def is_one_operation(condition: str) -> bool:
    """Returns true if the swap of its operator negates the whole of `condition`."""
    return bool(re.search(r"^!|[!=]= |^(true|false)$", condition)) and not re.search(r"&&|\|\|", condition)


def mutations(line: str, begins_statement: bool, returns_boolean: bool) -> list[str]:
    """Returns each different text that a mutation makes of `line`, which has no comment.

    >>> mutations("  if (!a) return 0;", True, False)
    ['  if (a) return 0;', '  if (!a) return 1;']
    >>> mutations("  if (const auto a = f(); a && b) {", True, True)
    ['  if (const auto a = f(); a || b) {', '  if (const auto a = f(); !(a && b)) {']
    >>> mutations('  set("key", 2);', True, False)
    ['  set("key", 3);', '  set("key", 1);', '  set("keyX", 2);', '  ;']
    >>> mutations("  return f(a);", True, True)
    ['  return !(f(a));']
    >>> mutations("  int a = f(b);", True, True) + mutations("  f(a);", False, True)
    []
    """
    code = masked(line)
    edits = [(found.start(), found.end(), SWAPPED[found[0]]) for found in OPERATOR.finditer(code)]
    for number in INTEGER.finditer(code):
        edits += [(*number.span(), str(int(number[0]) + step)) for step in (1, -1) if int(number[0]) + step >= 0]
    edits += [(key.end(1), key.end(1), "X") for key in KEY.finditer(line) if code[key.start()] == "@"]
    negatable = [condition_of_if(code)]
    if returns_boolean and (found := RETURN.search(code)):
        negatable.append(found.span(1))
    for begin, end in filter(None, negatable):
        if not is_one_operation(code[begin:end]):
            edits.append((begin, end, f"!({line[begin:end]})"))
    if begins_statement and code.count("(") == code.count(")") and CALL_OR_ASSIGNMENT.match(code):
        edits.append((len(line) - len(line.lstrip()), len(code), ";"))
    return list(dict.fromkeys(line[:begin] + text + line[end:] for begin, end, text in edits))


def mutations_of(lines: list[str]) -> list[tuple[int, str]]:
    """Returns the index of a line and what a mutation makes of it, for all lines of a file without their comments."""
    result, last_code, returns_boolean = [], "", False
    for index, line in enumerate(lines):
        if line.startswith("}") or BOOLEAN_FUNCTION.match(line):
            returns_boolean = not line.startswith("}")
        if not NOT_CODE.match(line):
            begins_statement = last_code[-1:] in {"", ";", "{", "}", ":"}
            result += [(index, text) for text in mutations(line, begins_statement, returns_boolean)]
            last_code = masked(line)
    return result
