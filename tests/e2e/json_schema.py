"""Checks a JSON document against the part of JSON Schema (draft 7) that the project's schemas use."""

TYPES = {
    "object": lambda v: isinstance(v, dict),
    "array": lambda v: isinstance(v, list),
    "string": lambda v: isinstance(v, str),
    "boolean": lambda v: isinstance(v, bool),
    "integer": lambda v: isinstance(v, int) and not isinstance(v, bool),
    "number": lambda v: isinstance(v, (int, float)) and not isinstance(v, bool),
}
NOTES = {"$schema", "title", "description", "definitions"}


def problems(value, schema, root=None, where="$"):
    """A list of what is wrong; a keyword that is not known here raises."""
    root = root or schema
    found = []
    for keyword, argument in schema.items():
        if keyword in NOTES:
            continue
        found += CHECKS[keyword](value, argument, schema, root, where)
    return found


def _reference(value, argument, schema, root, where):
    target = root
    for part in argument.removeprefix("#/").split("/"):
        target = target[part]
    return problems(value, target, root, where)


def _properties(value, argument, schema, root, where):
    if not isinstance(value, dict):
        return []
    return [p for name, member in value.items() if name in argument
            for p in problems(member, argument[name], root, f"{where}.{name}")]


def _additional(value, argument, schema, root, where):
    if argument is not False or not isinstance(value, dict):
        return []
    return [f"{where}.{name}: not known" for name in value if name not in schema.get("properties", {})]


def _items(value, argument, schema, root, where):
    if not isinstance(value, list):
        return []
    return [p for i, item in enumerate(value) for p in problems(item, argument, root, f"{where}[{i}]")]


def _required(value, argument, schema, root, where):
    if not isinstance(value, dict):
        return []
    return [f"{where}.{name}: missing" for name in argument if name not in value]


def _any_of(value, argument, schema, root, where):
    return [] if any(not problems(value, option, root, where) for option in argument) else [f"{where}: fits nothing"]


def _number(wrong):
    return lambda value, argument, schema, root, where: (
        [f"{where}: {value} out of range"] if TYPES["number"](value) and wrong(value, argument) else [])


CHECKS = {
    "$ref": _reference,
    "properties": _properties,
    "additionalProperties": _additional,
    "items": _items,
    "required": _required,
    "anyOf": _any_of,
    "type": lambda value, kind, schema, root, where: [] if TYPES[kind](value) else [f"{where}: no {kind}"],
    "enum": lambda value, allowed, schema, root, where: [] if value in allowed else [f"{where}: {value!r} not allowed"],
    "minimum": _number(lambda value, limit: value < limit),
    "maximum": _number(lambda value, limit: value > limit),
}
