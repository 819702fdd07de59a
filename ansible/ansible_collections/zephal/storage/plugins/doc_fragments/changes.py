# -*- coding: utf-8 -*-
# What every module that changes the host shares: check and diff mode, and the values the
# shared runner adds to each result. Return values cannot come from a fragment, so those are
# described here as notes rather than once per module.

from __future__ import absolute_import, division, print_function

__metaclass__ = type


class ModuleDocFragment(object):
    DOCUMENTATION = r'''
options: {}
notes:
  - Supports check mode (through C(autocli --dry-run)) and diff mode.
  - Besides its return values, the result holds C(commands), the autocli commands run that change the
    host (each a list of arguments, with C(--dry-run) in check mode), and in check mode C(host_calls),
    the host calls the dry runs reported, one entry per call.
'''
