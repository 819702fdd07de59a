#!/usr/bin/python
# -*- coding: utf-8 -*-

from __future__ import absolute_import, division, print_function

__metaclass__ = type

DOCUMENTATION = r'''
---
module: storage_nfs_firewall
short_description: Keep entries of the NFS client rule set of a Zephal host
description:
  - Adds or removes IP/Mask entries of the NFS v3 (C(nfsClient)) or NFS v4.1 (C(nfs41Client))
    client rule set by running C(autocli storage nfs firewall ...) or
    C(autocli storage nfs41 firewall ...) on the managed host.
extends_documentation_fragment:
  - zephal.storage.autocli
  - zephal.storage.changes
options:
  version:
    description:
      - Which rule set, the NFS v3 one or the NFS v4.1 one.
    type: str
    choices: ['3', '4.1']
    default: '3'
  entries:
    description:
      - IP/Mask entries (C(10.0.0.0/8), C(192.168.1.5), C(fd00::/8)), each as the host lists it.
    type: list
    elements: str
    required: true
  state:
    description:
      - C(present) adds the entries that are missing.
      - C(absent) removes the given entries that are there.
      - C(exact) makes the rule set hold the given entries and no others (removals first).
        The host keeps entries in the order they were added; the order is not compared.
    type: str
    choices: [present, absent, exact]
    default: present
notes:
  - A host that stores entries in a normal form (a network address for a mask) lists them that
    way; give them in that form, or every run adds them again.
'''

EXAMPLES = r'''
- name: The storage network may reach NFS servers
  zephal.storage.storage_nfs_firewall:
    entries: [10.20.30.0/24]

- name: Only these may, for NFS v4.1
  zephal.storage.storage_nfs_firewall:
    version: '4.1'
    entries: [10.20.30.41, 10.20.30.42]
    state: exact

- name: The old lab network may not
  zephal.storage.storage_nfs_firewall:
    entries: [192.168.0.0/16]
    state: absent
'''

RETURN = r'''
entries:
  description: The rule set after the task; in check mode, what it would be.
  returned: always
  type: list
  elements: str
  sample: [10.20.30.0/24, fd00:20:30::/64]
added:
  description: Entries added (or that would be, in check mode).
  returned: always
  type: list
  elements: str
removed:
  description: Entries removed (or that would be, in check mode).
  returned: always
  type: list
  elements: str
'''

from ansible.module_utils.basic import AnsibleModule
from ansible_collections.zephal.storage.plugins.module_utils.autocli import (
    Autocli, argument_spec, check_list_entries, rule_set)

NAMESPACES = {'3': 'nfs', '4.1': 'nfs41'}


def unique(entries):
    seen = set()
    return [e for e in entries if not (e in seen or seen.add(e))]


def main():
    module = AnsibleModule(
        argument_spec=argument_spec(
            version=dict(type='str', choices=['3', '4.1'], default='3'),
            entries=dict(type='list', elements='str', required=True),
            state=dict(type='str', choices=['present', 'absent', 'exact'], default='present'),
        ),
        supports_check_mode=True,
    )
    params = module.params
    check_list_entries(module, 'entries', params['entries'])
    wanted = unique(params['entries'])
    namespace = NAMESPACES[params['version']]
    cli = Autocli(module)

    before = rule_set(cli, namespace)

    state = params['state']
    to_add = [e for e in wanted if e not in before] if state != 'absent' else []
    if state == 'absent':
        to_remove = [e for e in wanted if e in before]
    elif state == 'exact':
        to_remove = [e for e in before if e not in wanted]
    else:
        to_remove = []

    for entry in to_remove:
        cli.change('storage', namespace, 'firewall', 'remove', '--ip-mask', entry)
    for entry in to_add:
        cli.change('storage', namespace, 'firewall', 'add', '--ip-mask', entry)

    after = [e for e in before if e not in to_remove] + to_add
    if cli.changed and not module.check_mode:
        after = rule_set(cli, namespace)

    cli.exit(dict(before=''.join(e + '\n' for e in before), after=''.join(e + '\n' for e in after),
                  before_header='%s client rule set' % namespace, after_header='%s client rule set' % namespace),
             entries=after, added=to_add, removed=to_remove)


if __name__ == '__main__':
    main()
