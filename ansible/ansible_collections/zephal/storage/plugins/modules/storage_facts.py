#!/usr/bin/python
# -*- coding: utf-8 -*-

from __future__ import absolute_import, division, print_function

__metaclass__ = type

DOCUMENTATION = r'''
---
module: storage_facts
short_description: Report the storage of a Zephal host as facts
description:
  - Runs autocli's list commands on the managed host and returns what they show as facts,
    the volumes, the NFS v3 and v4.1 volumes, both NFS client rule sets, the HLFS locking
    modes and the space reclamation settings of each HLFS volume.
  - Each row's keys are autocli's field titles in lower case, with every run of other characters
    than letters and digits made one C(_) (C(Volume Name) is C(volume_name), C(Host(s)) is C(host_s)).
extends_documentation_fragment:
  - zephal.storage.autocli
options:
  gather:
    description:
      - Which facts to gather. A host without HLFS support cannot list locking modes; leave
        C(lockmodes) out there.
    type: list
    elements: str
    choices: [volumes, nfs, nfs41, firewall, lockmodes, reclaim]
    default: [volumes, nfs, nfs41, firewall, lockmodes, reclaim]
notes:
  - Changes nothing; runs the same in check mode.
'''

EXAMPLES = r'''
- name: What each host has
  zephal.storage.storage_facts:

- name: Which hosts lack the backup share
  ansible.builtin.debug:
    msg: "{{ inventory_hostname }} has no nfs-backup"
  when: "'nfs-backup' not in storage_nfs_volumes | map(attribute='volume_name')"

- name: Only the rule sets
  zephal.storage.storage_facts:
    gather: [firewall]
'''

RETURN = r'''
ansible_facts:
  description: The facts gathered; each key is there only when its part was gathered.
  returned: always
  type: dict
  contains:
    storage_volumes:
      description: C(storage filesystem list), one entry per volume.
      type: list
      elements: dict
      sample: [{mount_point: /hlfs/volumes/5f8d2a31-6c1e47b2-9a0f-001e67c4d2a8, volume_name: datastore1,
                uuid: 5f8d2a31-6c1e47b2-9a0f-001e67c4d2a8, type: HLFS-6, mounted: true,
                size: 536602476544, free: 343328948224}]
    storage_nfs_volumes:
      description: C(storage nfs list), one entry per NFS v3 volume.
      type: list
      elements: dict
      sample: [{volume_name: nfs-iso, host: 10.20.30.40, share: /exports/iso, mounted: true, read_only: true}]
    storage_nfs41_volumes:
      description: C(storage nfs41 list), one entry per NFS v4.1 volume.
      type: list
      elements: dict
      sample: [{volume_name: nfs41-vms, host_s: '10.20.30.41,10.20.30.42', share: /exports/vms, security: sys}]
    storage_nfs_firewall:
      description: The NFS v3 client rule set, one IP/Mask per entry.
      type: list
      elements: str
      sample: [10.20.30.0/24, fd00:20:30::/64]
    storage_nfs41_firewall:
      description: The NFS v4.1 client rule set, one IP/Mask per entry.
      type: list
      elements: str
      sample: [10.20.30.41, 10.20.30.42]
    storage_hlfs_lockmodes:
      description: C(storage hlfs lockmode list), one entry per HLFS volume.
      type: list
      elements: dict
      sample: [{volume_name: datastore1, locking_mode: ATS, ats_compatible: true}]
    storage_hlfs_reclaim:
      description: C(storage hlfs reclaim config get) for each HLFS volume, with its name and UUID.
      type: list
      elements: dict
      sample: [{volume_name: datastore1, uuid: 5f8d2a31-6c1e47b2-9a0f-001e67c4d2a8,
                reclaim_granularity: 1048576, reclaim_priority: low, reclaim_method: priority,
                reclaim_bandwidth: 0}]
'''

from ansible.module_utils.basic import AnsibleModule
from ansible_collections.zephal.storage.plugins.module_utils.autocli import (
    Autocli, argument_spec, fact_row, rule_set)

PARTS = ['volumes', 'nfs', 'nfs41', 'firewall', 'lockmodes', 'reclaim']


def rows(cli, *args):
    return [fact_row(row) for row in cli.query(*args) or []]


def reclaim_settings(cli, volumes):
    settings = []
    for volume in volumes:
        if not volume.get('type', '').startswith('HLFS'):
            continue
        config = cli.query('storage', 'hlfs', 'reclaim', 'config', 'get', '--volume-uuid', volume['uuid']) or {}
        settings.append(dict(fact_row(config), volume_name=volume['volume_name'], uuid=volume['uuid']))
    return settings


def main():
    module = AnsibleModule(
        argument_spec=argument_spec(
            gather=dict(type='list', elements='str', choices=PARTS, default=list(PARTS)),
        ),
        supports_check_mode=True,
    )
    gather = set(module.params['gather'])
    cli = Autocli(module)
    facts = {}
    volumes = None
    if gather & {'volumes', 'reclaim'}:
        volumes = rows(cli, 'storage', 'filesystem', 'list')
    if 'volumes' in gather:
        facts['storage_volumes'] = volumes
    if 'nfs' in gather:
        facts['storage_nfs_volumes'] = rows(cli, 'storage', 'nfs', 'list')
    if 'nfs41' in gather:
        facts['storage_nfs41_volumes'] = rows(cli, 'storage', 'nfs41', 'list')
    if 'firewall' in gather:
        facts['storage_nfs_firewall'] = rule_set(cli, 'nfs')
        facts['storage_nfs41_firewall'] = rule_set(cli, 'nfs41')
    if 'lockmodes' in gather:
        facts['storage_hlfs_lockmodes'] = rows(cli, 'storage', 'hlfs', 'lockmode', 'list')
    if 'reclaim' in gather:
        facts['storage_hlfs_reclaim'] = reclaim_settings(cli, volumes)
    module.exit_json(changed=False, ansible_facts=facts)


if __name__ == '__main__':
    main()
