"""Turns abidw's description of the library (stdin) into a readable record of its binary interface: functions and globals
with their types, and then every type that these refer to, with sizes and offsets in bytes."""

import subprocess
import sys
import xml.etree.ElementTree as ElementTree

root = ElementTree.parse(sys.stdin).getroot()
by_id = {}
for node in root.iter():
    if "id" in node.attrib and node.get("is-declaration-only") != "yes":
        by_id[node.get("id")] = node
for node in root.iter():
    if "id" in node.attrib:
        by_id.setdefault(node.get("id"), node)

reached = {}  # the descriptions of types, by name


def parameters(function):
    return ", ".join("..." if p.get("is-variadic") else name(p.get("type-id"))
                     for p in function.findall("parameter") if p.get("is-artificial") != "yes") or "void"


def returned(function):
    result = function.find("return")
    return name(result.get("type-id")) if result is not None else "void"


def name(type_id):
    """Returns the type as a declaration has it, and records the types that it refers to."""
    node = by_id[type_id]
    if node.tag == "pointer-type-def":
        target = by_id[node.get("type-id")]
        if target.tag == "function-type":
            return f"{returned(target)} (*)({parameters(target)})"
        return name(node.get("type-id")) + " *"
    if node.tag == "reference-type-def":
        return name(node.get("type-id")) + " &"
    if node.tag == "qualified-type-def":
        words = [word for word in ("const", "volatile") if node.get(word) == "yes"]
        pointer = by_id[node.get("type-id")].tag == "pointer-type-def"
        parts = [name(node.get("type-id"))] + words if pointer else words + [name(node.get("type-id"))]
        return " ".join(parts)
    if node.tag == "array-type-def":
        sizes = "".join(f"[{s.get('length')}]" for s in node.findall("subrange"))
        return name(node.get("type-id")) + sizes
    own = node.get("name")
    if node.tag == "typedef-decl" and by_id[node.get("type-id")].get("name") == own:
        return name(node.get("type-id"))  # the typedef that C needs
    if own not in reached and node.tag in ("typedef-decl", "class-decl", "union-decl", "enum-decl"):
        reached[own] = ""  # a type may refer to itself
        reached[own] = describe(node)
    return own


def describe(node):
    own = node.get("name")
    if node.tag == "typedef-decl":
        # The C library's own names change between releases.
        base = by_id[node.get("type-id")]
        while base.tag == "typedef-decl" and base.get("name").startswith("__"):
            base = by_id[base.get("type-id")]
        return f"typedef {own} = {name(base.get('id'))}"
    if node.tag == "enum-decl":
        return f"enum {own}: " + ", ".join(f"{e.get('name')} {e.get('value')}" for e in node.findall("enumerator"))
    if node.get("is-declaration-only") == "yes":
        return f"record {own}, known by name alone"
    lines = [f"record {own}, {int(node.get('size-in-bits')) // 8} bytes"]
    for member in node.findall("data-member"):
        field = member.find("var-decl")
        offset = member.get("layout-offset-in-bits")
        if offset is not None:
            lines.append(f"{int(offset) // 8:6} {name(field.get('type-id'))} {field.get('name')}")
    return "\n".join(lines)


symbols = [s.get("name") for s in root.iter("elf-symbol") if s.get("is-defined") == "yes"]
readable = dict(zip(symbols, subprocess.run(["c++filt"], input="\n".join(symbols), text=True, check=True,
                                            stdout=subprocess.PIPE).stdout.split("\n")))
exports = set()
for node in root.iter():
    # If another source calls a C function, the node may be a mere declaration, without a symbol.
    symbol = node.get("elf-symbol-id") or node.get("name")
    if symbol not in readable:
        continue
    if node.tag == "var-decl":
        exports.add(f"{name(node.get('type-id'))} {readable[symbol]}")
    elif node.tag == "function-decl":
        if readable[symbol] == symbol:  # a C function, whose name does not encode its parameters
            exports.add(f"{returned(node)} {symbol}({parameters(node)})")
        else:
            parameters(node)
            structor = node.get("name").lstrip("~") == readable[symbol].split("::")[0]
            exports.add(("" if structor else returned(node) + " ") + readable[symbol])
unknown = [s for s in readable.values() if not any(f" {s}" in f" {e}" for e in exports)]
if unknown:
    sys.exit("no debug information for " + ", ".join(unknown))

print("# The library's binary interface on 32-bit ARM: script/abi writes this file, script/check compares.")
print("\n".join(sorted(exports, key=lambda e: e.split("(")[0].split()[-1] + e)))
print()
print("\n".join(text for _, text in sorted(reached.items()) if text))
