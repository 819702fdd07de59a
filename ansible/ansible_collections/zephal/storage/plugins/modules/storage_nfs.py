#!/usr/bin/python
# -*- coding: utf-8 -*-

from __future__ import absolute_import, division, print_function

__metaclass__ = type

DOCUMENTATION = r'''
---
module: storage_nfs
short_description: Keep an NFS v3 or v4.1 volume present and mounted, or absent, on a Zephal host
description:
  - Adds and mounts an NFS volume with the given servers, share and settings, or removes it,
    by running C(autocli storage nfs ...) or C(autocli storage nfs41 ...) on the managed host.
  - When a volume of that name exists with other settings, the task reports the difference and
    fails, unless C(replace) is set; then the volume is removed and added again.
  - A present volume that is not mounted is mounted.
extends_documentation_fragment:
  - zephal.storage.autocli
  - zephal.storage.changes
options:
  name:
    description:
      - The volume name. Volume names are unique across every kind of volume on the host.
    type: str
    required: true
    aliases: [volume_name]
  version:
    description:
      - The NFS protocol version of the volume.
    type: str
    choices: ['3', '4.1']
    default: '3'
  state:
    description:
      - C(present) adds the volume if needed and makes sure it is mounted.
      - C(absent) removes the volume of that name and version if there is one.
    type: str
    choices: [present, absent]
    default: present
  servers:
    description:
      - The NFS servers (host names or addresses). NFS v3 takes exactly one, NFS v4.1 one or more.
      - Required when C(state=present). Compared in order with the volume's servers.
    type: list
    elements: str
  share:
    description:
      - The share on the servers. Required when C(state=present).
    type: str
  read_only:
    description:
      - Whether the volume is mounted read-only.
      - When not given, a new volume is read-write and an existing volume's setting is accepted.
    type: bool
  connections:
    description:
      - NFS v3 only. The number of RPC connections (1 to 8; the host must offer the setting).
      - When not given, a new volume gets the host's default and an existing volume's number is accepted.
    type: int
  security:
    description:
      - NFS v4.1 only. The security flavour.
      - When not given, a new volume gets the host's default (C(sys)) and an existing volume's
        flavour is accepted.
    type: str
    choices: [sys, krb5, krb5i]
  replace:
    description:
      - When the volume exists with other settings (or as the other NFS version), remove it and
        add it again with the given ones instead of failing.
      - In check mode only the removal can be previewed, since the new volume's name is taken
        until it is gone.
    type: bool
    default: false
notes:
  - Servers bound to a named network interface are not handled by this module.
'''

EXAMPLES = r'''
- name: The backup share is mounted on every host
  zephal.storage.storage_nfs:
    name: nfs-backup
    servers: [10.20.30.40]
    share: /exports/backup
    read_only: false

- name: An NFS v4.1 volume over two servers, with Kerberos
  zephal.storage.storage_nfs:
    name: nfs41-vms
    version: '4.1'
    servers: [10.20.30.41, 10.20.30.42]
    share: /exports/vms
    security: krb5

- name: Move a volume to another share, even though it exists
  zephal.storage.storage_nfs:
    name: nfs-iso
    servers: [10.20.30.40]
    share: /exports/iso-2024
    replace: true

- name: The old volume is gone
  zephal.storage.storage_nfs:
    name: nfs-old
    state: absent
'''

RETURN = r'''
volume:
  description:
    - The volume's settings after the task; in check mode, the settings it would have.
    - Empty when the volume is absent.
  returned: always
  type: dict
  sample: {name: nfs-backup, version: '3', servers: [10.20.30.40], share: /exports/backup,
           read_only: false, connections: 1, mounted: true}
differences:
  description: Each setting that differed from the wanted one, with its value before and the wanted value.
  returned: when the volume existed with other settings
  type: dict
  sample: {share: {before: /exports/iso, after: /exports/iso-2024}}
'''

from ansible.module_utils.basic import AnsibleModule
from ansible_collections.zephal.storage.plugins.module_utils.autocli import (
    Autocli, argument_spec, check_list_entries, find_volume, split_list)

# Per version: the command namespace and the type filesystem list shows.
VERSIONS = {
    '3': dict(namespace='nfs', type='NFS'),
    '4.1': dict(namespace='nfs41', type='NFS41'),
}


def version_of(volume_type):
    for version, info in VERSIONS.items():
        if info['type'] == volume_type:
            return version
    return None


def read_settings(cli, name, version):
    """The volume's settings from its version's list, or None when the list does not show it."""
    for row in cli.query('storage', VERSIONS[version]['namespace'], 'list') or []:
        if row.get('Volume Name') != name:
            continue
        settings = dict(name=name, version=version, share=row.get('Share'),
                        read_only=row.get('Read-Only'), mounted=row.get('Mounted'))
        if version == '3':
            settings['servers'] = [row['Host']] if row.get('Host') else []
            settings['connections'] = row.get('Connections')
        else:
            settings['servers'] = split_list(row.get('Host(s)', ''))
            settings['security'] = row.get('Security')
        return settings
    return None


def wanted_settings(params):
    wanted = dict(name=params['name'], version=params['version'], servers=params['servers'],
                  share=params['share'])
    for key in ('read_only', 'connections', 'security'):
        if params[key] is not None:
            wanted[key] = params[key]
    return wanted


def differences(current, wanted):
    """Settings the user asked for that the volume does not have (mounting is not a setting)."""
    found = {}
    for key, value in wanted.items():
        if current.get(key) != value:
            found[key] = dict(before=current.get(key), after=value)
    return found


def add_arguments(params):
    version = params['version']
    args = ['storage', VERSIONS[version]['namespace'], 'add', '--volume-name', params['name'],
            '--share', params['share']]
    if version == '3':
        args += ['--host', params['servers'][0]]
        if params['connections'] is not None:
            args += ['--connections', str(params['connections'])]
    else:
        for server in params['servers']:
            args += ['--hosts', server]
        if params['security'] is not None:
            args += ['--sec', params['security']]
    if params['read_only']:
        args.append('--readonly')
    return args


def remove_arguments(name, version):
    return ['storage', VERSIONS[version]['namespace'], 'remove', '--volume-name', name]


def check_parameters(module):
    params = module.params
    version = params['version']
    if params['state'] != 'present':
        return
    if not params['servers']:
        module.fail_json(msg='servers must name at least one server when state is present')
    check_list_entries(module, 'servers', params['servers'])
    if version == '3' and len(params['servers']) != 1:
        module.fail_json(msg='An NFS v3 volume has exactly one server; %d given' % len(params['servers']))
    if version == '3' and params['security'] is not None:
        module.fail_json(msg='security applies to NFS v4.1 volumes only')
    if version == '4.1' and params['connections'] is not None:
        module.fail_json(msg='connections applies to NFS v3 volumes only')


def describe(found):
    return ', '.join("%s %r (wanted %r)" % (key, change['before'], change['after'])
                     for key, change in sorted(found.items()))


def main():
    module = AnsibleModule(
        argument_spec=argument_spec(
            name=dict(type='str', required=True, aliases=['volume_name']),
            version=dict(type='str', choices=['3', '4.1'], default='3'),
            state=dict(type='str', choices=['present', 'absent'], default='present'),
            servers=dict(type='list', elements='str'),
            share=dict(type='str'),
            read_only=dict(type='bool'),
            connections=dict(type='int'),
            security=dict(type='str', choices=['sys', 'krb5', 'krb5i']),
            replace=dict(type='bool', default=False),
        ),
        required_if=[('state', 'present', ('servers', 'share'))],
        supports_check_mode=True,
    )
    check_parameters(module)
    params = module.params
    name, version = params['name'], params['version']
    cli = Autocli(module)

    existing = find_volume(cli, name)
    existing_version = version_of(existing['Type']) if existing else None
    before = read_settings(cli, name, existing_version) if existing_version else None
    if existing_version and before is None:
        # The volume list shows it but its version's list does not (hidden volumes).
        cli.fail("NFS volume '%s' exists but its settings cannot be read" % name)

    if params['state'] == 'absent':
        after = before
        if existing_version == version:
            cli.change(*remove_arguments(name, version))
            after = None
        elif existing_version:
            module.warn("Volume '%s' is an NFS v%s volume, not v%s; left as it is" % (name, existing_version, version))
        finish(module, cli, before, after)
        return

    if existing and not existing_version:
        cli.fail("Volume '%s' exists and is not an NFS volume (type %s)" % (name, existing['Type']))

    wanted = wanted_settings(params)
    found = differences(before, wanted) if before else {}
    if found and not params['replace']:
        cli.fail("NFS volume '%s' exists with other settings: %s. Set replace: true to remove it and add it again"
                 % (name, describe(found)), differences=found, diff=dict(before=before, after=dict(before, **wanted)))

    if before is None or found:
        # A volume added now is read-write unless asked otherwise; the rest is the host's default.
        after = dict(wanted, read_only=bool(params['read_only']), mounted=True)
    else:
        after = dict(before, mounted=True)
    if before is None:
        cli.change(*add_arguments(params))
    elif found:
        cli.change(*remove_arguments(name, existing_version))
        # A dry run cannot add a volume whose name is still taken: the removal is the preview.
        if not module.check_mode:
            cli.change(*add_arguments(params))
    elif not before['mounted']:
        cli.change('storage', 'filesystem', 'mount', '--volume-label', name)
    finish(module, cli, before, after, found)


def finish(module, cli, before, after, found=None):
    if cli.changed and not module.check_mode and after is not None:
        after = read_settings(cli, after['name'], after['version']) or after
    shown = dict(differences=found) if found else {}
    cli.exit(dict(before=before or {}, after=after or {}), volume=after or {}, **shown)


if __name__ == '__main__':
    main()
