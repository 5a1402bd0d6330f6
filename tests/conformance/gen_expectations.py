#!/usr/bin/env python3
"""Writes what the type library must say, as read from the widl header.

The IDL is the one source of every interface, record and enum. This script
turns the generated C++ header into tables (interface with its base and its
methods in vtable order with their parameter names, record with its fields in
declaration order, enum with its values, class with its identifier), so that
the type library checks compare the library against the header without
restating either. Enum values and field offsets are left to the compiler: the
tables name the enumerators and use offsetof.

usage: gen_expectations.py HEADER OUTPUT
"""
import re
import sys
from pathlib import Path

INTERFACE_RE = re.compile(
    r'MIDL_INTERFACE\("[^"]+"\)\s*(\w+)\s*:\s*public\s+(\w+)\s*\{(.*?)\n\};', re.S)
METHOD_RE = re.compile(r'virtual\s+HRESULT\s+STDMETHODCALLTYPE\s+(\w+)\(\s*(.*?)\)\s*=\s*0;', re.S)
RECORD_RE = re.compile(r'^typedef struct (\w+) \{\n(.*?)\n\} \1;', re.S | re.M)
ENUM_RE = re.compile(r'^typedef enum (\w+) \{\n(.*?)\n\} \1;', re.S | re.M)
CLASS_RE = re.compile(r'^DEFINE_GUID\(CLSID_(\w+),', re.M)
FIELD_RE = re.compile(r'(\w+)\s*(?:\[[^\]]*\])?\s*;')
ENUMERATOR_RE = re.compile(r'^\s*(\w+)\s*(?:=[^,]*)?,?\s*$')


def parameter_names(text):
    text = ' '.join(text.split())
    if not text or text == 'void':
        return []
    return [re.search(r'(\w+)\s*(?:\[\s*\d*\s*\])?$', p.strip()).group(1) for p in text.split(',')]


def wide(name):
    return f'L"{name}"'


def main(header, output):
    text = Path(header).read_text()
    out = ['// Generated from the widl header by gen_expectations.py. Do not edit.', '']

    interfaces = INTERFACE_RE.findall(text)
    if not interfaces:
        sys.exit(f'no interface found in {header}')
    for name, _, body in interfaces:
        methods = METHOD_RE.findall(body)
        rows = []
        for method, raw in methods:
            params = ' '.join(parameter_names(raw))
            rows.append(f'    {{{wide(method)}, {wide(params)}}},')
        out.append(f'inline const MethodShape k{name}Methods[] = {{')
        out.extend(rows or ['    {nullptr, nullptr},'])
        out.append('};')
    out.append('inline const InterfaceShape kHeaderInterfaces[] = {')
    for name, base, body in interfaces:
        count = len(METHOD_RE.findall(body))
        out.append(f'    {{{wide(name)}, &IID_{name}, {wide(base)}, std::span(k{name}Methods, {count})}},')
    out.append('};')
    out.append('')

    records = [(n, b) for n, b in RECORD_RE.findall(text) if not n.endswith('Vtbl')]
    for name, body in records:
        fields = FIELD_RE.findall(body)
        out.append(f'inline const FieldShape k{name}Fields[] = {{')
        out.extend(f'    {{{wide(f)}, offsetof({name}, {f})}},' for f in fields)
        out.append('};')
    out.append('inline const RecordShape kHeaderRecords[] = {')
    out.extend(f'    {{{wide(n)}, sizeof({n}), k{n}Fields}},' for n, _ in records)
    out.append('};')
    out.append('')

    enums = ENUM_RE.findall(text)
    for name, body in enums:
        values = [m.group(1) for m in map(ENUMERATOR_RE.match, body.split('\n')) if m]
        out.append(f'inline const EnumeratorShape k{name}Values[] = {{')
        out.extend(f'    {{{wide(v)}, static_cast<LONG>(::{v})}},' for v in values)
        out.append('};')
    out.append('inline const EnumShape kHeaderEnums[] = {')
    out.extend(f'    {{{wide(n)}, k{n}Values}},' for n, _ in enums)
    out.append('};')
    out.append('')

    classes = CLASS_RE.findall(text)
    out.append('inline const ClassShape kHeaderClasses[] = {')
    out.extend(f'    {{{wide(n)}, &CLSID_{n}}},' for n in classes)
    out.append('};')

    content = '\n'.join(out) + '\n'
    path = Path(output)
    path.parent.mkdir(parents=True, exist_ok=True)
    if not path.exists() or path.read_text() != content:
        path.write_text(content)
    print(f'type library expectations: {len(interfaces)} interfaces, {len(records)} records, '
          f'{len(enums)} enums, {len(classes)} classes')


if __name__ == '__main__':
    if len(sys.argv) != 3:
        sys.exit(__doc__)
    main(sys.argv[1], sys.argv[2])
