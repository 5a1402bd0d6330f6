#!/usr/bin/env python3
"""Derives the controller object's method list from the widl-generated header.

The IDL is the one source of every interface; this script turns the generated
C++ declarations of the controller interfaces into X-macro lines, so that the
controller class declares its overrides without restating a signature, and
emits an E_NOTIMPL body for every operation that no source file defines yet.

usage: gen_controller_methods.py HEADER OUT_DIR STAMP INTERFACE... -- SOURCE...
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
    header, out_dir, stamp, wanted = Path(argv[1]), Path(argv[2]), Path(argv[3]), argv[4:sep]
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

    lines, pending, seen = [], [], {}
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
            if method not in defined:
                pending.append(entry)

    out_dir.mkdir(parents=True, exist_ok=True)
    banner = '// Generated from the widl header by gen_controller_methods.py. Do not edit.\n'
    write(out_dir / 'controller_methods.inc', banner + '\n'.join(lines) + '\n')
    write(out_dir / 'pending_operations.inc', banner + '\n'.join(pending) + '\n')
    stamp.touch()
    print(f'controller operations: {len(lines)}, not yet implemented: {len(pending)}')


def write(path, content):
    if not path.exists() or path.read_text() != content:
        path.write_text(content)


if __name__ == '__main__':
    main(sys.argv)
