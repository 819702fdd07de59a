"""Checks that each module's DOCUMENTATION options (with the shared fragment) are exactly the
options its AnsibleModule takes: same names, types, defaults, choices, elements and aliases.
Run with the Python that Ansible runs on; the argument is the folder holding ansible_collections."""

import importlib
import sys

import yaml

sys.dont_write_bytecode = True
sys.path.insert(0, sys.argv[1])
PREFIX = 'ansible_collections.zephal.storage.plugins.'
MODULES = ['storage_nfs', 'storage_nfs_firewall', 'storage_mount', 'storage_facts']


class Captured(Exception):
    pass


def taken_options(module):
    captured = {}

    def capture(**kwargs):
        captured.update(kwargs)
        raise Captured()

    module.AnsibleModule = capture
    try:
        module.main()
    except Captured:
        pass
    return captured['argument_spec']


fragment = yaml.safe_load(importlib.import_module(PREFIX + 'doc_fragments.autocli').ModuleDocFragment.DOCUMENTATION)
problems = []
for name in MODULES:
    module = importlib.import_module(PREFIX + 'modules.' + name)
    documented = dict(yaml.safe_load(module.DOCUMENTATION)['options'], **fragment['options'])
    taken = taken_options(module)
    for option in sorted(set(documented) | set(taken)):
        if option not in taken or option not in documented:
            problems.append('%s: option %s is %s' % (name, option, 'not taken' if option not in taken else 'undocumented'))
            continue
        for field in ('type', 'default', 'choices', 'elements', 'aliases', 'required'):
            doc, code = documented[option].get(field), taken[option].get(field)
            if doc != code and not (field == 'required' and not doc and not code):
                problems.append('%s: option %s: %s documented %r, taken %r' % (name, option, field, doc, code))
print('\n'.join(problems) or 'documentation matches the options')
sys.exit(1 if problems else 0)
