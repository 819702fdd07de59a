# -*- coding: utf-8 -*-
# What every module of the collection shares: its origin, and which autocli runs, on which state.

from __future__ import absolute_import, division, print_function

__metaclass__ = type


class ModuleDocFragment(object):
    DOCUMENTATION = r'''
version_added: 1.0.0
author:
  - Zephal storage team
options:
  autocli_path:
    description:
      - The autocli program on the managed host, an absolute path or a name looked up in C(PATH).
      - When the task does not set it, the host's inventory variable C(autocli_path) is used.
    type: str
    default: autocli
  autocli_state:
    description:
      - The host state file autocli works on (its C(--state) option), an absolute path.
      - When the task does not set it, the host's inventory variable C(autocli_state) is used;
        when neither is set, autocli chooses (C($AUTOCLI_STATE), else its default path).
      - The file must exist; create it once with C(autocli --state FILE --init-state).
    type: path
  autocli_host:
    description:
      - The host back end autocli talks to (its C(--host) option), for example C(sim) or C(linux).
      - When the task does not set it, the host's inventory variable C(autocli_host) is used;
        when neither is set, the option is not passed and autocli chooses.
      - A host that is not simulated has no state file; leave C(autocli_state) unset for it.
    type: str
notes:
  - Every change is made by running autocli on the managed host; in check mode the same commands
    run with C(--dry-run), so the host is asked what it would do and nothing is saved.
  - A command that fails fails the task with autocli's own message as C(msg) and its exit status
    as C(rc).
'''
