#!/usr/bin/python
# -*- coding: utf-8 -*-

from __future__ import absolute_import, division, print_function

__metaclass__ = type

DOCUMENTATION = r'''
---
module: storage_mount
short_description: Keep an HLFS or NFS volume of a Zephal host mounted or unmounted
description:
  - Mounts or unmounts a volume chosen by label or UUID by running
    C(autocli storage filesystem mount) or C(autocli storage filesystem unmount) on the managed
    host, when the volume list shows it in the other state.
  - A volume the host does not have fails the task with autocli's own message.
extends_documentation_fragment:
  - zephal.storage.autocli
  - zephal.storage.changes
options:
  label:
    description:
      - The volume's label (its volume name). Exactly one of C(label) and C(uuid) is given.
    type: str
    aliases: [name]
  uuid:
    description:
      - The volume's UUID. Exactly one of C(label) and C(uuid) is given.
    type: str
  state:
    description:
      - Whether the volume is to be mounted or unmounted.
    type: str
    choices: [mounted, unmounted]
    default: mounted
  persistent:
    description:
      - Whether a change lasts across a restart of the host. An unmount that does not last lets
        the host mount the volume again when it starts; a mount that does not last is undone.
      - Only used when the volume is mounted or unmounted by this task.
    type: bool
    default: true
'''

EXAMPLES = r'''
- name: The shared datastore is mounted everywhere
  zephal.storage.storage_mount:
    label: shared-ds01

- name: Take a volume away for maintenance until the next restart
  zephal.storage.storage_mount:
    uuid: 4e1c7a90-2d3b5f68-8c17-001e67c4d2a8
    state: unmounted
    persistent: false
'''

RETURN = r'''
volume:
  description: The volume as the volume list shows it after the task (keys as in storage_facts).
  returned: when the host has the volume
  type: dict
  sample: {volume_name: shared-ds01, uuid: 5f8d2b02-91a0c3e5-4d21-001e67c4d2a8, type: HLFS-5,
           mounted: true, mount_point: /hlfs/volumes/5f8d2b02-91a0c3e5-4d21-001e67c4d2a8,
           size: 2198754820096, free: 879340866765}
'''

from ansible.module_utils.basic import AnsibleModule
from ansible_collections.zephal.storage.plugins.module_utils.autocli import (
    Autocli, argument_spec, fact_row, find_volume)


def main():
    module = AnsibleModule(
        argument_spec=argument_spec(
            label=dict(type='str', aliases=['name']),
            uuid=dict(type='str'),
            state=dict(type='str', choices=['mounted', 'unmounted'], default='mounted'),
            persistent=dict(type='bool', default=True),
        ),
        mutually_exclusive=[('label', 'uuid')],
        required_one_of=[('label', 'uuid')],
        supports_check_mode=True,
    )
    params = module.params
    label, uuid = params['label'], params['uuid']
    if (label if label is not None else uuid) == '':
        module.fail_json(msg='label or uuid must not be empty')
    cli = Autocli(module)
    mount = params['state'] == 'mounted'

    volume = find_volume(cli, label, uuid)
    if volume is None or volume.get('Mounted') != mount:
        # A missing volume goes to autocli as well: its message says what was not found.
        args = ['storage', 'filesystem', 'mount' if mount else 'unmount']
        args += ['--volume-label', label] if label is not None else ['--volume-uuid', uuid]
        if not params['persistent']:
            args.append('--no-persist')
        cli.change(*args)

    before = dict(mounted=volume.get('Mounted')) if volume else {}
    after = dict(mounted=mount) if volume else {}
    if cli.changed and not module.check_mode:
        volume = find_volume(cli, label, uuid) or volume
    elif cli.changed:
        volume = dict(volume, Mounted=mount)
    shown = dict(volume=fact_row(volume)) if volume else {}
    cli.exit(dict(before=before, after=after), **shown)


if __name__ == '__main__':
    main()
