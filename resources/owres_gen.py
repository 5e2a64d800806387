#!/usr/bin/env python3
"""Builds the C++ source of one resource module from its text sources.

The generated source defines the data symbols described in include/owutils/ResourceModule.h
(and, for an engine module, the OEM records of include/owutils/LmOem.h); the CMake function
owutils_add_resource_module compiles it into OW<Name><language>.so.

Text sources are UTF-8. Lines starting with '#' and blank lines are ignored everywhere.

String table (STRINGS):
    <id> "<text>"
  id is decimal or 0x-hex, 0..65535, each id once. The text is quoted; inside it
  \\n \\r \\t \\\\ \\" and \\uXXXX are escapes.

Message table (MESSAGES), a small subset of the message compiler's syntax:
    MessageId=<id>
    SymbolicName=<name>          (optional, for the reader)
    <text line>
    ...
    .
  Every text line becomes one line of the message ending in CR LF; a line holding only '.'
  ends the message. %1-style inserts are kept as written.

OEM records (OEM):
    [__OEMData]
    <field> = <value>
    [__OEMEmailInfo]
    <field> = <value>
  Fields are those of _tagSYSOEM and _tagOEMEmailInfo in LmOem.h; array elements are written
  <field>[<index>]. Numbers are decimal or 0x-hex; texts are taken as they stand after '='
  (trimmed) and stored in Windows-1252. Fields not named stay zero.
"""

import argparse
import re
import sys


class SourceError(Exception):
    pass


def fail(path, line, message):
    raise SourceError(f"{path}:{line}: error: {message}")


def parse_number(text, path, line, limit):
    try:
        value = int(text, 0)
    except ValueError:
        fail(path, line, f"'{text}' is not a number")
    if value < 0 or value > limit:
        fail(path, line, f"{value} is out of range (0..{limit})")
    return value


def unescape(body, path, line):
    out = []
    i = 0
    while i < len(body):
        c = body[i]
        if c == '"':
            fail(path, line, "unescaped quote inside the text")
        if c != "\\":
            out.append(c)
            i += 1
            continue
        if i + 1 >= len(body):
            fail(path, line, "the text ends with a lone backslash")
        e = body[i + 1]
        simple = {"n": "\n", "r": "\r", "t": "\t", "\\": "\\", '"': '"'}
        if e in simple:
            out.append(simple[e])
            i += 2
        elif e == "u" and re.fullmatch(r"[0-9A-Fa-f]{4}", body[i + 2:i + 6] or ""):
            out.append(chr(int(body[i + 2:i + 6], 16)))
            i += 6
        else:
            fail(path, line, f"unknown escape '\\{e}'")
    return "".join(out)


def read_lines(path):
    with open(path, encoding="utf-8-sig") as f:
        return f.read().splitlines()


def parse_strings(path):
    table = {}
    for number, raw in enumerate(read_lines(path), 1):
        line = raw.strip()
        if not line or line.startswith("#"):
            continue
        m = re.fullmatch(r'(\S+)\s+"(.*)"', line)
        if not m:
            fail(path, number, 'expected: <id> "<text>"')
        ident = parse_number(m.group(1), path, number, 0xFFFF)
        if ident in table:
            fail(path, number, f"string {ident} is defined twice")
        text = unescape(m.group(2), path, number)
        if not text:
            fail(path, number, f"string {ident} is empty (an empty string counts as missing)")
        table[ident] = text
    return table


def parse_messages(path):
    table = {}
    current = None
    lines = []
    for number, raw in enumerate(read_lines(path), 1):
        if current is None:
            line = raw.strip()
            if not line or line.startswith("#"):
                continue
            m = re.fullmatch(r"MessageId\s*=\s*(\S+)", line, re.IGNORECASE)
            if not m:
                fail(path, number, "expected MessageId=<id>")
            current = parse_number(m.group(1), path, number, 0xFFFFFFFF)
            if current in table:
                fail(path, number, f"message {current} is defined twice")
            lines = []
            header = True
            start = number
            continue
        if header and re.fullmatch(r"\s*(SymbolicName|Severity|Facility|Language)\s*=.*", raw,
                                   re.IGNORECASE):
            continue
        header = False
        if raw.strip() == ".":
            if not lines:
                fail(path, number, f"message {current} has no text")
            table[current] = "".join(l + "\r\n" for l in lines)
            current = None
            continue
        lines.append(raw.rstrip())
    if current is not None:
        fail(path, start, f"message {current} is not ended by a line holding '.'")
    return table


def parse_oem_layout(header):
    """The fields of the two narrow OEM records, from LmOem.h: name -> (kind, dims)."""
    with open(header, encoding="utf-8") as f:
        source = f.read()
    layouts = {}
    for record in ("_tagSYSOEM", "_tagOEMEmailInfo"):
        m = re.search(r"struct\s+" + record + r"\s*\{(.*?)\};", source, re.S)
        if not m:
            raise SourceError(f"{header}: no definition of {record}")
        fields = {}
        for decl in re.finditer(r"^\s*(DWORD|BYTE|char)\s+(\w+)((?:\[\d+\])*);", m.group(1), re.M):
            dims = [int(d) for d in re.findall(r"\[(\d+)\]", decl.group(3))]
            fields[decl.group(2)] = (decl.group(1), dims)
        layouts[record] = fields
    return layouts


def parse_oem(path, layouts):
    symbols = {"__OEMData": "_tagSYSOEM", "__OEMEmailInfo": "_tagOEMEmailInfo"}
    values = {"__OEMData": [], "__OEMEmailInfo": []}
    section = None
    seen = set()
    for number, raw in enumerate(read_lines(path), 1):
        line = raw.strip()
        if not line or line.startswith("#"):
            continue
        m = re.fullmatch(r"\[(\w+)\]", line)
        if m:
            if m.group(1) not in symbols:
                fail(path, number, f"unknown record [{m.group(1)}]")
            section = m.group(1)
            continue
        if section is None:
            fail(path, number, "a field outside [__OEMData] or [__OEMEmailInfo]")
        m = re.fullmatch(r"(\w+)(?:\[(\d+)\])?\s*=\s*(.*)", line)
        if not m:
            fail(path, number, "expected <field> = <value>")
        name, index, value = m.group(1), m.group(2), m.group(3)
        fields = layouts[symbols[section]]
        if name not in fields:
            fail(path, number, f"{symbols[section]} has no field '{name}'")
        kind, dims = fields[name]
        key = (section, name, index)
        if key in seen:
            fail(path, number, f"{name} is set twice")
        seen.add(key)
        target = f"r.{name}"
        if kind == "char" and len(dims) == 2:
            if index is None or int(index) >= dims[0]:
                fail(path, number, f"{name} needs an index below {dims[0]}")
            target += f"[{int(index)}]"
            size = dims[1]
        elif index is not None:
            fail(path, number, f"{name} is not an array of texts")
        else:
            size = dims[0] if dims else 0
        if kind == "char":
            try:
                data = value.encode("cp1252")
            except UnicodeEncodeError:
                fail(path, number, f"the text of {name} has characters outside Windows-1252")
            if len(data) > size - 1:
                fail(path, number, f"the text of {name} is {len(data)} bytes; the field holds {size - 1}")
            literal = "".join(f"\\{b:03o}" for b in data)
            values[section].append(f'  Put({target}, "{literal}");')
        else:
            limit = 0xFF if kind == "BYTE" else 0xFFFFFFFF
            values[section].append(f"  {target} = {parse_number(value, path, number, limit)}u;")
    return values


def utf16_array(name, text):
    units = text.encode("utf-16-le")
    codes = [int.from_bytes(units[i:i + 2], "little") for i in range(0, len(units), 2)]
    body = ", ".join(f"0x{c:04X}" for c in codes + [0])
    return f"constexpr char16_t {name}[] = {{{body}}};", len(codes)


def generate(args):
    strings = parse_strings(args.strings) if args.strings else {}
    messages = parse_messages(args.messages) if args.messages else {}
    out = [
        "// Generated by owres_gen.py: edit the text sources, not this file.",
        "#include <cstddef>",
        "#include \"owutils/ResourceModule.h\"",
    ]
    if args.oem:
        out.append("#include \"owutils/LmOem.h\"")
    out.append("namespace {")
    entries = []
    for i, ident in enumerate(sorted(strings)):
        decl, length = utf16_array(f"kString{i}", strings[ident])
        out.append(decl)
        entries.append(f"    {{{ident}u, {length}u, kString{i}}},")
    if entries:
        out.append("constexpr OwResourceString kStrings[] = {")
        out.extend(entries)
        out.append("};")
    entries = []
    for i, ident in enumerate(sorted(messages)):
        decl, length = utf16_array(f"kMessage{i}", messages[ident])
        out.append(decl)
        entries.append(f"    {{{ident}u, {length}u, kMessage{i}}},")
    if entries:
        out.append("constexpr OwResourceMessage kMessages[] = {")
        out.extend(entries)
        out.append("};")
    if args.oem:
        values = parse_oem(args.oem, parse_oem_layout(args.oem_header))
        out.append("template <std::size_t N, std::size_t M>")
        out.append("constexpr void Put(char (&field)[N], const char (&text)[M]) {")
        out.append("  static_assert(M <= N, \"text longer than its field\");")
        out.append("  for (std::size_t i = 0; i < M; ++i) field[i] = text[i];")
        out.append("}")
        out.append("constexpr _tagSYSOEM MakeOemData() {")
        out.append("  _tagSYSOEM r{};")
        out.extend(values["__OEMData"])
        out.append("  return r;")
        out.append("}")
        out.append("constexpr _tagOEMEmailInfo MakeOemEmailInfo() {")
        out.append("  _tagOEMEmailInfo r{};")
        out.extend(values["__OEMEmailInfo"])
        out.append("  return r;")
        out.append("}")
    out.append("}  // namespace")
    out.append("")
    out.append("OWUTILS_RESOURCE_EXPORT constinit const OwResourceTable OWResourceTable = {")
    out.append(f"    kOwResourceMagic, kOwResourceVersion, 0x{args.language:X},")
    out.append(f"    {len(strings)}u, {len(messages)}u,")
    out.append(f"    {'kStrings' if strings else 'nullptr'}, {'kMessages' if messages else 'nullptr'}}};")
    if args.oem:
        out.append("OWUTILS_RESOURCE_EXPORT constinit const _tagSYSOEM __OEMData = MakeOemData();")
        out.append("OWUTILS_RESOURCE_EXPORT constinit const _tagOEMEmailInfo __OEMEmailInfo = "
                   "MakeOemEmailInfo();")
    return "\n".join(out) + "\n"


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("--language", required=True, type=lambda v: int(v, 16),
                        help="language identifier in hexadecimal, e.g. 409")
    parser.add_argument("--strings")
    parser.add_argument("--messages")
    parser.add_argument("--oem")
    parser.add_argument("--oem-header", help="LmOem.h, for the record fields")
    parser.add_argument("--output", required=True)
    args = parser.parse_args()
    if args.oem and not args.oem_header:
        parser.error("--oem needs --oem-header")
    try:
        text = generate(args)
    except (SourceError, OSError) as e:
        print(e, file=sys.stderr)
        return 1
    with open(args.output, "w", encoding="utf-8") as f:
        f.write(text)
    return 0


if __name__ == "__main__":
    sys.exit(main())
