# -*- coding: utf-8 -*-
# Controller side of every module: a task that does not name autocli's path, state file or
# back end gets them from the host's inventory variables, so one play drives many hosts.

from __future__ import absolute_import, division, print_function

__metaclass__ = type

from ansible.plugins.action import ActionBase

HOST_VARIABLES = ('autocli_path', 'autocli_state', 'autocli_host')


class HostOptionsAction(ActionBase):
    _supports_check_mode = True

    def run(self, tmp=None, task_vars=None):
        task_vars = task_vars or {}
        result = super(HostOptionsAction, self).run(tmp, task_vars)
        args = dict(self._task.args)
        for name in HOST_VARIABLES:
            if args.get(name) is None and task_vars.get(name) is not None:
                args[name] = self._templar.template(task_vars[name])
        module = getattr(self._task, 'resolved_action', None) or self._task.action
        result.update(self._execute_module(module_name=module, module_args=args, task_vars=task_vars))
        return result
