# -*- coding: utf-8 -*-
# Shared by every module of this collection: how autocli is found and called on the
# managed host, how its answers are read, and how its failures become task failures.

from __future__ import absolute_import, division, print_function

__metaclass__ = type

import json
import os
import re

# Options every module takes; the action plugins fill them from the host's inventory
# variables of the same names when a task does not set them.
HOST_OPTIONS = dict(
    autocli_path=dict(type='str', default='autocli'),
    autocli_state=dict(type='path'),
    autocli_host=dict(type='str'),
)

# autocli's dry run ends its messages with this line; the host calls follow it.
DRY_RUN_MARK = 'Dry run: nothing was saved.'


def argument_spec(**options):
    merged = dict(HOST_OPTIONS)
    merged.update(options)
    return merged


def fact_key(title):
    """A field title as autocli prints it ("Read-Only", "Host(s)") as a fact key ("read_only", "host_s")."""
    return re.sub(r'[^0-9a-z]+', '_', title.lower()).strip('_')


def fact_row(row):
    return dict((fact_key(k), v) for k, v in row.items())


def split_list(text):
    """autocli prints list values joined by commas; an empty text is an empty list."""
    return [item for item in text.split(',') if item] if text else []


def check_list_entries(module, option, entries):
    """Entries are passed one per argument and read back comma-joined, so a comma or a blank
    inside one, or an empty one, could never be matched again."""
    for entry in entries:
        if not entry or ',' in entry or entry != entry.strip() or ' ' in entry:
            module.fail_json(msg="%s: '%s' is not a single entry (no commas or blanks, not empty)" % (option, entry))


def find_volume(cli, label=None, uuid=None):
    """The volume of that label or UUID as filesystem list shows it (any kind), or None. Of several
    volumes with one label, the first, as the host's own look-up picks it."""
    for row in cli.query('storage', 'filesystem', 'list') or []:
        if (label is not None and row.get('Volume Name') == label) or (uuid is not None and row.get('UUID') == uuid):
            return row
    return None


def rule_set(cli, namespace):
    """The entries of an NFS client rule set ('nfs' or 'nfs41'), in the host's order."""
    listed = cli.query('storage', namespace, 'firewall', 'list') or {}
    return split_list(listed.get('Allowed IPMask', ''))


class Autocli:
    """Runs autocli with the host's options and the json formatter, never through a shell."""

    def __init__(self, module):
        self.module = module
        self.commands = []
        self.host_calls = []
        self.changed = False
        params = module.params
        path = params['autocli_path']
        state = params.get('autocli_state')
        # A relative path would be taken from wherever the module happens to run.
        if os.sep in path and not os.path.isabs(path):
            module.fail_json(msg="autocli_path '%s' must be a name or an absolute path" % path)
        if state and not os.path.isabs(state):
            module.fail_json(msg="autocli_state '%s' must be an absolute path" % state)
        if os.sep not in path:
            found = module.get_bin_path(path)
            if not found:
                module.fail_json(msg="autocli not found: '%s' is not in PATH on this host; set autocli_path" % path)
            path = found
        self.base = [path]
        if state:
            self.base += ['--state', state]
        if params.get('autocli_host'):
            self.base += ['--host', params['autocli_host']]
        self.base += ['--formatter', 'json']

    def query(self, *args):
        """A command that only reads; it runs in check mode as well."""
        out = self._run(self.base + list(args), dry_run=False)
        return self._parse(out, args)

    def change(self, *args):
        """A command that changes the host. In check mode it runs as a dry run: the host
        calls it would make are kept in host_calls and nothing is saved."""
        dry_run = self.module.check_mode
        argv = self.base + (['--dry-run'] if dry_run else []) + list(args)
        self.commands.append(argv)
        out = self._run(argv, dry_run)
        self.changed = True
        return self._parse(out, args)

    def fail(self, msg, **extra):
        extra.setdefault('changed', self.changed)
        extra.setdefault('commands', self.commands)
        if self.module.check_mode:
            extra.setdefault('host_calls', self.host_calls)
        self.module.fail_json(msg=msg, **extra)

    def _run(self, argv, dry_run):
        # Arguments are user text: no shell, and no expansion of "~" or "$NAME" in them.
        rc, out, err = self.module.run_command(argv, check_rc=False, expand_user_and_vars=False)
        messages, calls = self._split_dry_run(err) if dry_run else (err, [])
        self.host_calls += calls
        if rc != 0:
            text = messages.strip() or 'autocli exited with status %d' % rc
            self.fail(text, rc=rc, cmd=argv, stdout=out, stderr=err)
        return out

    @staticmethod
    def _split_dry_run(err):
        lines = err.splitlines()
        if DRY_RUN_MARK not in lines:
            return err, []
        at = lines.index(DRY_RUN_MARK)
        calls = []
        for line in lines[at + 1:]:
            if not line.strip():
                continue
            try:
                calls.append(json.loads(line))
            except ValueError:
                calls.append(line)
        return '\n'.join(lines[:at]), calls

    def _parse(self, out, args):
        if not out.strip():
            return None
        try:
            return json.loads(out)
        except ValueError as e:
            self.fail("autocli printed output that is not JSON for '%s': %s" % (' '.join(args), e), stdout=out)

    def result(self, **values):
        values.setdefault('changed', self.changed)
        values['commands'] = self.commands
        if self.module.check_mode:
            values['host_calls'] = self.host_calls
        return values

    def exit(self, diff, **values):
        """Ends the task with the result; diff (a dict with before and after) shows in diff mode."""
        result = self.result(**values)
        if self.module._diff:
            result['diff'] = diff
        self.module.exit_json(**result)
