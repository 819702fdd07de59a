# -*- coding: utf-8 -*-
# Fills autocli's path, state file and back end from the host's inventory variables.

from __future__ import absolute_import, division, print_function

__metaclass__ = type

from ansible_collections.zephal.storage.plugins.plugin_utils.host_options import HostOptionsAction


class ActionModule(HostOptionsAction):
    pass
