#!/usr/bin/env python3
"""Derives the controller object's method list from the widl-generated header.

The IDL is the one source of every interface; this script turns the generated
C++ declarations of the controller interfaces into X-macro lines, so that the
controller class declares its overrides without restating a signature, and
emits an E_NOTIMPL body for every operation that no source file defines yet.

The operations that the controller object hands slot for slot to a sibling
component (--forward INTERFACE=ACCESSOR: that interface and its bases, to the
component interface the object's ACCESSOR() returns) get generated bodies in
forwarded_operations.cpp: the initialised check, the call with the
arguments unchanged, the component's error adopted on failure.

usage: gen_controller_methods.py HEADER OUT_DIR STAMP [--forward I=ACCESSOR]... INTERFACE... -- SOURCE...
"""
import re
import sys
from pathlib import Path

INTERFACE_RE = re.compile(
    r'MIDL_INTERFACE\("[^"]+"\)\s*(\w+)\s*:\s*public\s+(\w+)\s*\{(.*?)\n\};', re.S)
METHOD_RE = re.compile(r'virtual\s+HRESULT\s+STDMETHODCALLTYPE\s+(\w+)\(\s*(.*?)\)\s*=\s*0;', re.S)
DEFINED_RE = re.compile(r'\bControllerObject::(\w+)\s*\(')


def parameters(text):
    text = ' '.join(text.split())
    if not text or text == 'void':
        return [], []
    params = [p.strip() for p in text.split(',')]
    names = [re.search(r'(\w+)\s*(\[\s*\d*\s*\])?$', p).group(1) for p in params]
    return params, names


def main(argv):
    sep = argv.index('--')
    header, out_dir, stamp = Path(argv[1]), Path(argv[2]), Path(argv[3])
    rest = argv[4:sep]
    forwards = {}
    wanted = []
    i = 0
    while i < len(rest):
        if rest[i] == '--forward':
            iface, accessor = rest[i + 1].split('=')
            forwards[iface] = accessor
            i += 2
        else:
            wanted.append(rest[i])
            i += 1
    sources = argv[sep + 1:]
    text = header.read_text()
    interfaces = {}
    for name, base, body in INTERFACE_RE.findall(text):
        interfaces[name] = (base, METHOD_RE.findall(body))
    missing = [i for i in wanted if i not in interfaces]
    if missing:
        sys.exit(f'interfaces not found in {header}: {missing}')

    defined = set()
    for src in sources:
        defined.update(DEFINED_RE.findall(Path(src).read_text(errors='replace')))

    # Each forwarded interface with its bases, up to IUnknown.
    forwarded = {}  # method -> (component interface, accessor)
    for iface, accessor in forwards.items():
        chain, current = [], iface
        while current in interfaces:
            chain.append(current)
            current = interfaces[current][0]
        for member in chain:
            for method, _ in interfaces[member][1]:
                forwarded[method] = (iface, accessor)
    clash = sorted(defined & set(forwarded))
    if clash:
        sys.exit(f'forwarded operations also defined by hand: {clash}')

    lines, pending, forwarding, seen = [], [], [], {}
    for iface in wanted:
        for method, raw in interfaces[iface][1]:
            params, names = parameters(raw)
            signature = '(' + ', '.join(params) + ')'
            if method in seen:
                if seen[method] != signature:
                    sys.exit(f'{method} is declared twice with different parameters')
                continue
            seen[method] = signature
            entry = f'TAV_CONTROLLER_METHOD({iface}, {method}, {signature}, ({", ".join(names)}))'
            lines.append(entry)
            if method in forwarded:
                component, accessor = forwarded[method]
                forwarding.append(forward_body(method, signature, names, component, accessor))
            elif method not in defined:
                pending.append(entry)

    out_dir.mkdir(parents=True, exist_ok=True)
    banner = '// Generated from the widl header by gen_controller_methods.py. Do not edit.\n'
    write(out_dir / 'controller_methods.inc', banner + '\n'.join(lines) + '\n')
    write(out_dir / 'pending_operations.inc', banner + '\n'.join(pending) + '\n')
    write(out_dir / 'forwarded_operations.cpp',
          banner + '#include "core/controller_object.h"\n\nnamespace tav {\n\n' + '\n'.join(forwarding) +
          '\n}  // namespace tav\n')
    stamp.touch()
    print(f'controller operations: {len(lines)}, forwarded: {len(forwarding)}, '
          f'not yet implemented: {len(pending)}')


def forward_body(method, signature, names, component, accessor):
    # Each failure on a line of its own: the error suffix tells them apart.
    args = ''.join(f', {n}' for n in names)
    return (f'HRESULT STDMETHODCALLTYPE ControllerObject::{method}{signature} {{\n'
            f'    return Forward({accessor}(),\n'
            f'                   ErrorSite::Here(),  // used before Init\n'
            f'                   ErrorSite::Here(),  // the component failed\n'
            f'                   &{component}::{method}{args});\n'
            f'}}\n')


def write(path, content):
    if not path.exists() or path.read_text() != content:
        path.write_text(content)


if __name__ == '__main__':
    main(sys.argv)
