#!/usr/bin/env python3
"""Generates the expected-ABI tables of the CMPI header test from the CMPI 2.0 reference notes.

The notes are a markdown document with measured sizes, offsets and values. This script reads its
tables and writes two include files next to itself, which are committed with the test:

  abi_expected.inc      one X-macro row per fact (ABI_SCALAR, ABI_STRUCT, ABI_MEMBER, ...); the
                        C and C++ test sources define the row macros they need and include it
  abi_macro_checks.inc  preprocessor checks: every constant is a macro, every other macro the
                        notes name for a default build is defined (function-like ones such as
                        CMGetProperty and the MI stub and factory macros included), and no
                        enumerator is a macro

The test never reads the notes itself; rerun this script when the notes change:

  python3 tests/abi/gen_abi_expected.py path/to/cmpi-2.0-reference.md

The script cross-checks what it reads (slot numbers in order, members that neither overlap nor
fail to add up to the struct size, decimal against hex values, the "sizeof(...) = N" sentences
against the size table) and stops on any inconsistency, so that a mistake in the notes or in the
parsing does not end up as an expected value. Macro names are taken from every backticked name in
the notes, tables and running text alike; each one must turn out to be a type, a tag, an
enumerator, a constant, a macro of the default build or one of the names in NOT_DEFINED, and the
script stops on a name it cannot place.
"""

import os
import re
import sys

HERE = os.path.dirname(os.path.abspath(__file__))

C_WORDS = {
    "const", "volatile", "unsigned", "signed", "short", "long", "int", "char", "void", "float",
    "double", "struct", "union", "enum", "size_t", "pthread_key_t",
}


# Backticked names that may be macros. Types, tags and enumerators share these prefixes; they are
# recognised from the tables and sorted out.
MACRO_CANDIDATE = re.compile(r"^(CM|CB|CD|_CMPI)\w*$")

# Names the notes mention that a 2.0 header set does not define in a default build, and why. A
# name listed here that the notes no longer mention stops the script, so the list stays current.
NOT_DEFINED = {
    "CMPI_VERSION": "set by a provider build to choose the level, never by the headers",
    "CMPI_VER_ALL": "set by a build to choose every level, never by the headers",
    "CMPI_INLINE": "a build switch (inline functions instead of macros), not set by the headers",
    "CMPI_NO_INLINE": "not read by the headers at all",
    "CMPI_NO_SYNONYM_SUPPORT": "a build switch that removes the synonyms of the type codes",
    "CMBrokerVersion": "appears only in a comment; the broker-version macro is CBBrokerVersion",
    "CMEvaluatePredicate": "exists for the levels 0.87 to 0.9x only",
    "CBSetInstance": "what CBModifyInstance turns into in a 1.0 build",
    "CMPI_SEV_DEBUG": "a misspelling the notes warn about; the enumerator is CMPI_DEV_DEBUG",
    "CMPI_String": "a misspelt type code used by CMFmtString; the code is CMPI_string",
    "CMPI_VER_x": "stands for the CMPI_VER_<level> switches, which are listed one by one",
    "CMFmtX": "stands for the CMFmt<type> helpers, which are listed one by one",
    "CMFmtArgsN": "stands for CMFmtArgs0 to CMFmtArgs10, expanded from the stated range",
}
# Set by the build (exactly one of them); our cmpipl.h picks the Linux one when none is given.
NOT_DEFINED_PREFIX = ("CMPI_PLATFORM_", "set by the build to name the platform")

# Macros of a default build that the notes leave unnamed, and why they are checked anyway.
EXTRA_MACROS = {
    "CMIndicationMIFactoryExtensions": (
        "object", "the two CMPI_VER_86 entries of CMIndicationMIFactory, the factory's "
        "counterpart of CMIndicationMIStubExtensions; the notes describe the factory macros only "
        "as a group and do not name this helper"),
}


def fail(msg):
    sys.exit("gen_abi_expected.py: " + msg)


def cells(line):
    parts = line.strip().split("|")
    return [p.strip() for p in parts[1:-1]]


def ticked(text):
    return re.findall(r"`([^`]*)`", text)


def norm_type(t):
    t = re.sub(r"\s+", " ", t.strip())
    t = re.sub(r"\s*\*\s*", " *", t)
    return t.replace("* *", "**").replace("( *", "(*").strip()


def split_decl(decl):
    """'const void *hdl' -> ('const void *', 'hdl')"""
    m = re.match(r"^(.*?)(\w+)$", decl.strip())
    if not m:
        fail("cannot split declaration %r" % decl)
    return norm_type(m.group(1)), m.group(2)


def strip_param_name(p):
    """Turns a parameter declaration into the bare type used in a function pointer type."""
    p = p.strip()
    if p == "...":
        return p
    # function-pointer parameter: drop the name inside (*name) / (CMPI_THREAD_CDECL *name)
    m = re.search(r"\(\s*((?:CMPI_THREAD_CDECL\s*)?)\*\s*(\w+)\s*\)", p)
    if m:
        inner = "(" + (m.group(1).strip() + " " if m.group(1) else "") + "*)"
        return norm_type(p[: m.start()] + inner + p[m.end():])
    tokens = re.findall(r"\w+|\*", p)
    last = tokens[-1]
    is_name = (len(tokens) > 1 and last != "*" and last not in C_WORDS
               and not last.startswith("CMPI"))
    if is_name:
        p = p[: p.rfind(last)]
    return norm_type(p)


def unqualified(t):
    """Top-level const does not survive lvalue conversion in C's _Generic."""
    if t.endswith("*"):
        return t
    return re.sub(r"^const\s+", "", t)


class Collector:
    def __init__(self):
        self.scalars = []        # (name, decl, size, align, signed)
        self.os_macros = []      # (name, size)
        self.constants = []      # (name, value, section)
        self.enumerators = []    # (enum typedef, name, value)
        self.strings = []        # (name, value)
        self.structs = {}        # name -> (size, align)
        self.members = []        # (struct, member, off, size, kind, type)
        self.stated_sizes = {}   # from "sizeof(X) = **N**" sentences
        self.handle_sizes = {}   # from the sizeof column of the handle tables
        self.macros = {}         # name -> [kind ("function" or "object"), heading]; see macros()
        self.left_out = {}       # names mentioned but not defined in a default build -> reason
        self.headings = [""]     # every heading in document order, for grouping the macros

    def member(self, struct, member, off, size, kind, typ):
        for s, m, *_ in self.members:
            if s == struct and m == member:
                fail("duplicate member %s.%s" % (struct, member))
        self.members.append((struct, member, off, size, kind, typ))


def parse(path):
    with open(path, encoding="utf-8") as f:
        lines = f.read().splitlines()

    c = Collector()
    heading = ""
    context = ""  # latest heading or paragraph, for naming the enum of the next table
    in_para = False
    i = 0
    while i < len(lines):
        line = lines[i]
        if line.startswith("#"):
            heading = line
            context, in_para = line, False
            i += 1
            continue
        for m in re.finditer(r"sizeof\((\w+)\) = \*\*(\d+)\*\*", line):
            c.stated_sizes[m.group(1)] = int(m.group(2))
        if not (line.startswith("|") and i + 1 < len(lines) and lines[i + 1].startswith("|---")):
            if not line.strip():
                in_para = False
            elif in_para:
                context += " " + line
            else:
                context, in_para = line, True
            i += 1
            continue
        header = cells(line)
        rows = []
        i += 2
        while i < len(lines) and lines[i].startswith("|"):
            rows.append(cells(lines[i]))
            i += 1
        handle_table(c, header, rows, heading, context)
    return c


def title(heading):
    """'### 9.5 Factory services (`CMPIBrokerEncFT`)' -> 'Factory services (CMPIBrokerEncFT)'"""
    return re.sub(r"^#+\s*[\d.]*\s*", "", heading).replace("`", "")


def macros(path, c):
    """Collects every macro the notes name for a default build into c.macros.

    Each backticked name that looks like a CMPI macro must be placed: a type (scalar, struct,
    the further typedefs, an enum), a tag, an enumerator, a constant or context entry name
    (already checked on their own), a name in NOT_DEFINED, or otherwise a macro. A macro's group
    is the heading of the table row that describes it, else of its first mention. Families given
    as XxxN(...) with a stated range "`N` runs from a ... to b" are expanded.
    """
    with open(path, encoding="utf-8") as f:
        lines = f.read().splitlines()

    types = {x[0] for x in c.scalars} | set(c.structs) | {e for e, n, v in c.enumerators}
    enumerators = {n for e, n, v in c.enumerators}
    checked = {x[0] for x in c.constants} | {x[0] for x in c.strings}
    guards = set()
    described = {}  # name -> heading of the table row that describes it
    mentioned = {}  # name -> heading of its first mention
    function_like = set()
    guard_text = {}  # name -> guard column of its row
    intro = {}  # names mentioned before the first section

    heading = ""
    header = None
    for line in lines:
        if line.startswith("#"):
            heading = line
            c.headings.append(heading)
        if line.startswith("|"):
            row = cells(line)
            if line.startswith("|---"):
                continue  # the separator under the header (no backticked names)
            if header is None:
                header = [x.lower() for x in row]
            else:
                first = ticked(row[0])
                if header[:2] == ["typedef", "what it is"] and first:
                    types.add(first[0])
                if "include guard" in header:
                    guards.update(ticked(row[header.index("include guard")]))
                if first and (header[0].startswith("macro") or header[0] == "helper"):
                    m = re.match(r"^(\w+)", first[0])
                    if m:
                        described.setdefault(m.group(1), heading)
                        for k, col in enumerate(header):
                            if col.startswith("guard") and k < len(row):
                                guard_text[m.group(1)] = row[k]
        else:
            header = None
        # A whole backticked text that is a name, or a macro call such as `CMGetProperty(inst,
        # name, rc)`. Patterns (`CM*MIStub`) and declarations are not names.
        for t in ticked(line):
            m = re.match(r"^(\w+)(\([^()]*\))?$", t.strip())
            if not m or not (MACRO_CANDIDATE.match(m.group(1)) or m.group(1) in guards):
                continue
            # The introduction only previews names; group them where they are explained.
            if heading.startswith("## ") or heading.startswith("### "):
                mentioned.setdefault(m.group(1), heading)
            else:
                intro.setdefault(m.group(1), heading)
            if m.group(2):
                function_like.add(m.group(1))
    for name, h in intro.items():
        mentioned.setdefault(name, h)

    # Families such as CMFmtArgsN(...), expanded with the range stated in a paragraph that names
    # the family (other mentions, in tables for instance, need not repeat the range).
    text = "\n".join(lines)
    families = set(re.findall(r"`(\w+)N\([^`]*\)`", text))
    heading = ""
    for para in re.split(r"\n\s*\n", text):
        for line in para.splitlines():
            if line.startswith("#"):
                heading = line
        r = re.search(r"`N` runs from (\d+)\b.*?\bto (\d+)\b", para, re.S)
        for fam in re.findall(r"`(\w+)N\([^`]*\)`", para) if r else []:
            families.discard(fam)
            for n in range(int(r.group(1)), int(r.group(2)) + 1):
                name = "%s%d" % (fam, n)
                described.setdefault(name, heading)
                mentioned.setdefault(name, heading)
                function_like.add(name)
    if families:
        fail("no range stated for the family %sN" % sorted(families)[0])

    for name in NOT_DEFINED:
        if name not in mentioned:
            fail("NOT_DEFINED lists %s, which the notes do not mention" % name)
    for name in EXTRA_MACROS:
        if name in mentioned:
            fail("EXTRA_MACROS lists %s, which the notes name themselves" % name)

    for name, heading in mentioned.items():
        if name in NOT_DEFINED:
            c.left_out[name] = NOT_DEFINED[name]
        elif name.startswith(NOT_DEFINED_PREFIX[0]):
            c.left_out[name] = NOT_DEFINED_PREFIX[1]
        elif name in types or name in enumerators or name in checked:
            continue
        elif name.startswith("_CMPI") and name not in guards:
            continue  # struct, union or enum tag
        else:
            guard = guard_text.get(name, "").split(";")[0]
            if re.search(r"\bnot\b", guard):
                fail("%s is guarded by %r; decide whether a default build has it" % (name, guard))
            kind = "function" if name in function_like else "object"
            c.macros[name] = [kind, described.get(name, heading)]
    for name, (kind, _) in EXTRA_MACROS.items():
        c.macros[name] = [kind, None]

    # Wildcards such as CM*MIStub must match names found.
    for t in re.findall(r"`(CM\*\w+)`", text):
        pat = re.compile("^" + t.replace("*", "\\w*") + "$")
        if not any(pat.match(n) for n in c.macros):
            fail("no macro matches %s" % t)


def heading_type(heading):
    names = ticked(heading)
    if not names:
        fail("no type name in heading %r" % heading)
    return names[0]


def handle_table(c, header, rows, heading, context):
    h = [x.lower() for x in header]
    section = re.match(r"#+\s*([\d.]+)", heading)
    section = section.group(1) if section else ""

    if h[:5] == ["typedef", "declared as", "size", "align", "signed"]:
        for r in rows:
            name = ticked(r[0])[0]
            decl = re.sub(r"\s*\(MSVC:.*\)", "", ticked(r[1])[0]).strip()
            signed = {"yes": "1", "no": "0"}[r[4]]
            if decl.endswith("*"):
                signed = "na"  # pointers have no signedness
            elif decl in ("float", "double"):
                signed = "real"  # signed, but not usable in an integer constant expression
            c.scalars.append((name, decl, int(r[2]), int(r[3]), signed))

    elif h == ["macro", "linux value", "size"]:
        for r in rows:
            if r[2]:
                c.os_macros.append((ticked(r[0])[0], int(r[2])))

    elif h[:3] == ["name", "decimal", "hex"]:
        for r in rows:
            name = ticked(r[0])[0]
            dec, hx = int(r[1]), int(r[2], 16)
            if dec != hx:
                fail("%s: decimal %d and hex %s disagree" % (name, dec, r[2]))
            c.constants.append((name, dec, section))

    elif h == ["enumerator", "value"]:
        m = re.search(r"typedef `(\w+)`", context)
        if not m:
            fail("enumerator table without an enum name near %r" % context)
        for r in rows:
            c.enumerators.append((m.group(1), ticked(r[0])[0], int(r[1])))

    elif h[:2] == ["value", "enumerator"]:
        m = re.search(r"typedef `(\w+)`", context)
        if not m:
            fail("wide enumerator table without an enum name near %r" % context)
        for r in rows:
            for k in range(0, len(r) - 1, 2):
                if r[k]:
                    c.enumerators.append((m.group(1), ticked(r[k + 1])[0], int(r[k])))

    elif h[:2] == ["macro", "string value"]:
        for r in rows:
            c.strings.append((ticked(r[0])[0], ticked(r[1])[0].strip('"')))

    elif h == ["member", "type", "off", "size"]:
        struct = "CMPIBroker" if section == "5.5" else heading_type(heading)
        for r in rows:
            if not r[0].startswith("`"):
                continue  # (padding)
            typ = norm_type(ticked(r[1])[0])
            c.member(struct, ticked(r[0])[0], int(r[2]), int(r[3]), "data", typ)

    elif h[:3] == ["#", "member", "type"]:  # CMPIValue: every member at offset 0
        struct = heading_type(heading)
        for r in rows:
            typ = norm_type(ticked(r[2])[0])
            c.member(struct, ticked(r[1])[0], 0, int(r[3]), "data", typ)

    elif h[:3] == ["type", "member 0 (off 0)", "member 1 (off 8)"]:
        for r in rows:
            struct = ticked(r[0])[0]
            for col, off in ((1, 0), (2, 8)):
                typ, name = split_decl(ticked(r[col])[0])
                c.member(struct, name, off, 8, "data", typ)
            c.handle_sizes[struct] = int(r[3])

    elif h[:3] == ["#", "off", "member"]:
        struct = heading_type(heading)
        for r in rows:
            off, name = int(r[1]), ticked(r[2])[0]
            m = re.match(r"data member: `([^`]*)` \((\d+) bytes\)", r[3])
            if m:
                c.member(struct, name, off, int(m.group(2)), "data", norm_type(m.group(1)))
                continue
            ret = norm_type(ticked(r[3])[0])
            params = [strip_param_name(p) for p in ticked(r[4])]
            fn = "%s (*)(%s)" % (ret, ", ".join(params))
            c.member(struct, name, off, 8, "fn", fn)
        slots = [int(r[0]) for r in rows]
        if slots != list(range(len(rows))):
            fail("%s: slot numbers are not 0..%d in order" % (struct, len(rows) - 1))

    elif h == ["type", "sizeof", "align"]:
        for r in rows:
            c.structs[ticked(r[0])[0]] = (int(r[1]), int(r[2]))


def cross_check(c):
    if not c.structs:
        fail("no size table found")
    for name, size in list(c.stated_sizes.items()) + list(c.handle_sizes.items()):
        if name in c.structs and c.structs[name][0] != size:
            fail("%s: size %d in the text, %d in the size table" % (name, size, c.structs[name][0]))
    by_struct = {}
    for s, m, off, size, kind, typ in c.members:
        by_struct.setdefault(s, []).append((m, off, size, kind))
    for s, mem in by_struct.items():
        if s not in c.structs:
            fail("members given for %s but it is not in the size table" % s)
        size, align = c.structs[s]
        if s == "CMPIValue":
            if max(x[2] for x in mem) != size:
                fail("CMPIValue: largest member is not the union size")
            continue
        # members must not overlap and must be in increasing order
        end = 0
        for m, off, msize, kind in mem:
            if off < end:
                fail("%s.%s at %d overlaps the previous member" % (s, m, off))
            if off % min(msize, 8) != 0:
                fail("%s.%s at %d is misaligned" % (s, m, off))
            end = off + msize
        if (end + align - 1) // align * align != size:
            fail("%s: members end at %d, which does not round up to size %d" % (s, end, size))
    for s in c.structs:
        if s not in by_struct:
            fail("%s has a size but no member table" % s)
    values = {}
    for e, n, v in c.enumerators:
        if n in values:
            fail("enumerator %s listed twice" % n)
        values[n] = v


def c_string(s):
    return '"' + s.replace("\\", "\\\\").replace('"', '\\"') + '"'


def write(c):
    out = []
    w = out.append
    w("/*")
    w(" * Expected ABI facts of the CMPI 2.0 headers on x86_64 Linux (LP64, GCC/Clang).")
    w(" * Generated by gen_abi_expected.py from the CMPI 2.0 reference notes; do not edit by hand.")
    w(" *")
    w(" * Include this file after defining the row macros you need; undefined ones are ignored:")
    w(" *   ABI_SCALAR(type, declared_as, size, align, is_signed)  is_signed: 1, 0, real or na")
    w(" *   ABI_OS_MACRO(macro, size)")
    w(" *   ABI_STRUCT(type, size, align)")
    w(" *   ABI_MEMBER(type, member, offset, size)")
    w(" *   ABI_DATA_TYPE(type, member, declared_type, type_after_lvalue_conversion)")
    w(" *   ABI_FN_TYPE(type, member, function_pointer_type)")
    w(" *   ABI_CONSTANT(macro, value)")
    w(" *   ABI_ENUMERATOR(enum_type, enumerator, value)")
    w(" *   ABI_STRING(macro, value)")
    w(" */")
    w("")
    kinds = ["ABI_SCALAR", "ABI_OS_MACRO", "ABI_STRUCT", "ABI_MEMBER", "ABI_DATA_TYPE",
             "ABI_FN_TYPE", "ABI_CONSTANT", "ABI_ENUMERATOR", "ABI_STRING"]
    for k in kinds:
        w("#ifndef %s" % k)
        w("#define %s(...)" % k)
        w("#define %s_DEFAULTED_" % k)
        w("#endif")
    w("")
    w("/* Scalar typedefs */")
    for name, decl, size, align, signed in c.scalars:
        w("ABI_SCALAR(%s, %s, %d, %d, %s)" % (name, decl, size, align, signed))
    w("")
    w("/* Thread-related macros */")
    for name, size in c.os_macros:
        w("ABI_OS_MACRO(%s, %d)" % (name, size))
    w("")
    w("/* Sizes and alignments of every struct and union */")
    for name, (size, align) in c.structs.items():
        w("ABI_STRUCT(%s, %d, %d)" % (name, size, align))
    w("")
    w("/* Offsets and sizes of every member */")
    current = None
    for s, m, off, size, kind, typ in c.members:
        if s != current:
            w("/* %s */" % s)
            current = s
        w("ABI_MEMBER(%s, %s, %d, %d)" % (s, m, off, size))
    w("")
    w("/* Declared types of every member */")
    current = None
    for s, m, off, size, kind, typ in c.members:
        if s != current:
            w("/* %s */" % s)
            current = s
        if kind == "fn":
            w("ABI_FN_TYPE(%s, %s, %s)" % (s, m, typ))
        else:
            w("ABI_DATA_TYPE(%s, %s, %s, %s)" % (s, m, typ, unqualified(typ)))
    w("")
    w("/* Constants (object-like macros) */")
    section = None
    for name, value, sec in c.constants:
        if sec != section:
            w("/* section %s */" % sec)
            section = sec
        w("ABI_CONSTANT(%s, %d)" % (name, value))
    w("")
    w("/* Enumerators */")
    current = None
    for e, n, v in c.enumerators:
        if e != current:
            w("/* %s */" % e)
            current = e
        w("ABI_ENUMERATOR(%s, %s, %d)" % (e, n, v))
    w("")
    w("/* Context entry names */")
    for name, value in c.strings:
        w("ABI_STRING(%s, %s)" % (name, c_string(value)))
    w("")
    for k in kinds:
        w("#ifdef %s_DEFAULTED_" % k)
        w("#undef %s" % k)
        w("#undef %s_DEFAULTED_" % k)
        w("#endif")
    with open(os.path.join(HERE, "abi_expected.inc"), "w", encoding="utf-8") as f:
        f.write("\n".join(out) + "\n")

    out = []
    w = out.append
    w("/*")
    w(" * Preprocessor checks of the CMPI 2.0 headers: every constant is an object-like macro,")
    w(" * no enumerator is a macro, and every other macro of a default build is defined, the")
    w(" * function-like ones and the C++ factory macros included (those are defined in C too).")
    w(" * Generated by gen_abi_expected.py; do not edit by hand.")
    w(" */")
    for name, value, sec in c.constants:
        w("#ifndef %s" % name)
        w('#error "%s is not defined as a macro"' % name)
        w("#endif")
    for name, value in c.strings:
        w("#ifndef %s" % name)
        w('#error "%s is not defined as a macro"' % name)
        w("#endif")
    for e, n, v in c.enumerators:
        w("#ifdef %s" % n)
        w('#error "%s must be an enumerator, not a macro"' % n)
        w("#endif")
    w("")
    w("/* Every other macro named for a default build, grouped by where it is described */")
    groups = c.headings + [None]
    for g in groups:
        names = [n for n, (kind, h) in c.macros.items() if h == g]
        if not names:
            continue
        if g is None:
            w("/* Not named in the notes: %s */" % ", ".join(names))
        else:
            w("/* %s */" % title(g))
        for n in names:
            kind = c.macros[n][0]
            w("#ifndef %s" % n)
            w('#error "%s is not defined (%s-like macro)"' % (n, kind))
            w("#endif")
    with open(os.path.join(HERE, "abi_macro_checks.inc"), "w", encoding="utf-8") as f:
        f.write("\n".join(out) + "\n")


def main():
    if len(sys.argv) != 2:
        sys.exit("usage: gen_abi_expected.py path/to/cmpi-2.0-reference.md")
    c = parse(sys.argv[1])
    macros(sys.argv[1], c)
    cross_check(c)
    write(c)
    fn = sum(1 for x in c.members if x[4] == "fn")
    print("scalars %d, thread macros %d, structs %d, members %d (function slots %d), "
          "constants %d, enumerators %d, strings %d" % (
              len(c.scalars), len(c.os_macros), len(c.structs), len(c.members), fn,
              len(c.constants), len(c.enumerators), len(c.strings)))
    fl = sum(1 for k, h in c.macros.values() if k == "function")
    print("other macros %d (function-like %d, object-like %d; %d not named in the notes: %s); "
          "macros checked in all %d" % (
              len(c.macros), fl, len(c.macros) - fl, len(EXTRA_MACROS), ", ".join(EXTRA_MACROS),
              len(c.macros) + len(c.constants) + len(c.strings)))
    for name, why in c.left_out.items():
        print("  not checked: %s: %s" % (name, why))


if __name__ == "__main__":
    main()
