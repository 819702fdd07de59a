#!/usr/bin/env python3
"""Runs the zephal.storage collection through ansible-playbook over simulated hosts on this
machine, each on its own state file in a temporary folder.

    run_playbooks.py AUTOCLI SOURCE_DIR docs|fleet|check|behaviour

Exits 77 (skipped) with the reason when ansible-core or an autocli feature a scenario needs is
missing. Nothing outside the temporary folder is written: Ansible's home and temporary folders
are pointed into it.
"""

import hashlib
import json
import os
import re
import shutil
import subprocess
import sys
import tempfile

SKIP = 77
HOSTS = ['host1', 'host2', 'host3']
RECAP = re.compile(r'^(\S+)\s*:\s*ok=(\d+)\s+changed=(\d+)\s+unreachable=(\d+)\s+failed=(\d+)', re.M)


class Failure(Exception):
    pass


def skip(reason):
    print('SKIPPED: ' + reason)
    sys.exit(SKIP)


def check(condition, what, output=''):
    if not condition:
        raise Failure(what + ('\n--- output ---\n' + output if output else ''))


def sha256(path):
    with open(path, 'rb') as f:
        return hashlib.sha256(f.read()).hexdigest()


class Lab:
    def __init__(self, autocli, source, work):
        self.autocli = autocli
        self.source = source
        self.work = work
        self.env = dict(os.environ)
        for name in list(self.env):
            # The user's own settings must not steer the run (or be touched by it).
            if name.startswith('ANSIBLE_') or name.startswith('AUTOCLI_'):
                del self.env[name]
        self.env.update(
            ANSIBLE_HOME=os.path.join(work, 'ansible-home'),
            ANSIBLE_LOCAL_TEMP=os.path.join(work, 'ansible-tmp'),
            ANSIBLE_REMOTE_TEMP=os.path.join(work, 'ansible-remote-tmp'),
            ANSIBLE_CONFIG=os.path.join(work, 'ansible.cfg'),
            ANSIBLE_COLLECTIONS_PATH=os.path.join(source, 'ansible'),
            ANSIBLE_NOCOLOR='1',
            ANSIBLE_FORCE_COLOR='0',
            ANSIBLE_RETRY_FILES_ENABLED='0',
            ANSIBLE_STDOUT_CALLBACK='default',
        )
        with open(self.env['ANSIBLE_CONFIG'], 'w') as f:
            f.write('[defaults]\nforks = 3\n')

    def autocli_run(self, *args):
        return subprocess.run([self.autocli] + list(args), capture_output=True, text=True, env=self.env)

    def make_states(self, folder, hosts):
        os.makedirs(folder, exist_ok=True)
        states = {}
        for host in hosts:
            path = os.path.join(folder, host + '.json')
            done = self.autocli_run('--state', path, '--init-state')
            check(done.returncode == 0 and os.path.isfile(path), 'autocli --init-state failed for ' + path,
                  done.stdout + done.stderr)
            states[host] = path
        return states

    def inventory(self, states, name):
        path = os.path.join(self.work, name)
        folders = set(os.path.dirname(state) for state in states.values())
        check(len(folders) == 1, 'one folder of state files per inventory')
        # The state path is a template over other variables, as an inventory would write it.
        hosts = {host: {'autocli_state': '{{ state_dir }}/%s' % os.path.basename(state)}
                 for host, state in states.items()}
        inventory = {'zephal_hosts': {'hosts': hosts, 'vars': {
            'state_dir': folders.pop(),
            'ansible_connection': 'local',
            'ansible_python_interpreter': '{{ ansible_playbook_python }}',
            'autocli_path': self.autocli}}}
        with open(path, 'w') as f:
            json.dump(inventory, f)
        return path

    def playbook(self, inventory, playbook, *options):
        done = subprocess.run(['ansible-playbook', '-i', inventory, playbook] + list(options),
                              capture_output=True, text=True, env=self.env, cwd=self.work)
        output = done.stdout + done.stderr
        recap = {m.group(1): dict(ok=int(m.group(2)), changed=int(m.group(3)), failed=int(m.group(5)))
                 for m in RECAP.finditer(done.stdout)}
        return done.returncode, recap, output


def probe(lab):
    """Which of the autocli features the scenarios need this build has."""
    folder = os.path.join(lab.work, 'probe')
    os.makedirs(folder)
    state = os.path.join(folder, 'probe.json')
    done = lab.autocli_run('--state', state, '--init-state')
    init = done.returncode == 0 and os.path.isfile(state)
    dry = False
    if init:
        before = sha256(state)
        done = lab.autocli_run('--state', state, '--dry-run', 'storage', 'nfs', 'firewall', 'add', '-F', '10.9.0.0/16')
        dry = done.returncode == 0 and 'Dry run: nothing was saved.' in done.stderr and sha256(state) == before
    return init, dry


def example_playbook(lab):
    return os.path.join(lab.source, 'ansible', 'examples', 'site.yml')


def scenario_docs(lab):
    modules = ['storage_nfs', 'storage_nfs_firewall', 'storage_mount', 'storage_facts']
    for module in modules:
        done = subprocess.run(['ansible-doc', 'zephal.storage.' + module], capture_output=True, text=True,
                              env=lab.env, cwd=lab.work)
        output = done.stdout + done.stderr
        check(done.returncode == 0, 'ansible-doc failed for ' + module, output)
        check('WARNING' not in done.stderr and 'ERROR' not in done.stderr, 'ansible-doc complained about ' + module,
              output)
        for part in ('OPTIONS', 'EXAMPLES:', 'RETURN VALUES:', 'autocli_state'):
            check(part in done.stdout, 'ansible-doc for %s lacks %s' % (module, part), output)
    # The options as documented are the options taken; Ansible itself only checks this in its own test tool.
    with open(shutil.which('ansible-doc')) as f:
        python = f.readline()[2:].split()
    done = subprocess.run(python + [os.path.join(lab.source, 'tests', 'ansible', 'doc_matches_options.py'),
                                    os.path.join(lab.source, 'ansible')], capture_output=True, text=True, env=lab.env)
    check(done.returncode == 0, 'documentation and options differ', done.stdout + done.stderr)
    done = subprocess.run(['ansible-doc', '-l', 'zephal.storage'], capture_output=True, text=True, env=lab.env,
                          cwd=lab.work)
    listed = sorted(line.split()[0] for line in done.stdout.splitlines() if line.strip())
    check(listed == sorted('zephal.storage.' + m for m in modules), 'modules listed: %s' % listed, done.stderr)


def scenario_fleet(lab):
    states = lab.make_states(os.path.join(lab.work, 'fleet'), HOSTS)
    inventory = lab.inventory(states, 'fleet.json')

    rc, recap, output = lab.playbook(inventory, example_playbook(lab), '--diff')
    check(rc == 0, 'first run failed (rc %d)' % rc, output)
    for host in HOSTS:
        check(recap.get(host, {}).get('changed', 0) > 0 and recap[host]['failed'] == 0,
              'first run: %s should change and not fail: %s' % (host, recap.get(host)), output)
    check('+10.20.40.0/24' in output, 'diff mode shows no added rule set entry', output)
    changed_states = {host: sha256(path) for host, path in states.items()}

    rc, recap, output = lab.playbook(inventory, example_playbook(lab))
    check(rc == 0, 'second run failed (rc %d)' % rc, output)
    for host in HOSTS:
        check(recap.get(host) is not None and recap[host]['changed'] == 0 and recap[host]['failed'] == 0,
              'second run: %s should change nothing: %s' % (host, recap.get(host)), output)
        check(sha256(states[host]) == changed_states[host], 'second run rewrote the state of ' + host, output)

    # A host whose NFS server refuses the mount: that host fails with autocli's message,
    # the others run the whole play.
    states = lab.make_states(os.path.join(lab.work, 'faulty'), HOSTS)
    message = 'Server 10.20.30.40 refused the mount of /exports/backup'
    with open(states['host2']) as f:
        state = json.load(f)
    state.setdefault('faults', []).append(
        {'call': 'NetworkFileSystem.Mount', 'target': 'nfs-backup', 'message': message})
    with open(states['host2'], 'w') as f:
        json.dump(state, f)
    rc, recap, output = lab.playbook(lab.inventory(states, 'faulty.json'), example_playbook(lab))
    check(rc == 2, 'a failed host should make ansible-playbook exit 2, not %d' % rc, output)
    check(recap.get('host2', {}).get('failed') == 1, 'host2 should fail: %s' % recap.get('host2'), output)
    fatal = re.search(r'^fatal: \[host2\]: FAILED! => (\{.*\})$', output, re.M)
    check(fatal is not None, 'no failure result for host2', output)
    result = json.loads(fatal.group(1))
    check(result.get('msg') == message and result.get('rc') == 1,
          'host2 should fail with autocli message and rc 1, got msg %r rc %r' % (result.get('msg'), result.get('rc')),
          output)
    for host in ('host1', 'host3'):
        check(recap.get(host, {}).get('failed') == 0 and recap[host]['ok'] > recap['host2']['ok'],
              '%s should finish the play: %s' % (host, recap.get(host)), output)


def scenario_check(lab):
    states = lab.make_states(os.path.join(lab.work, 'check'), HOSTS)
    inventory = lab.inventory(states, 'check.json')
    for round_name, expect_changes in (('before the first run', True), ('after the first run', False)):
        hashes = {host: sha256(path) for host, path in states.items()}
        rc, recap, output = lab.playbook(inventory, example_playbook(lab), '--check', '--diff')
        check(rc == 0, 'check mode %s failed (rc %d)' % (round_name, rc), output)
        for host in HOSTS:
            changed = recap.get(host, {}).get('changed', 0)
            check((changed > 0) == expect_changes,
                  'check mode %s: %s reported changed=%d' % (round_name, host, changed), output)
            check(sha256(states[host]) == hashes[host], 'check mode %s changed the state of %s' % (round_name, host),
                  output)
        if expect_changes:
            check('+10.20.40.0/24' in output, 'check mode shows no diff', output)
            rc, recap, output = lab.playbook(inventory, example_playbook(lab))
            check(rc == 0, 'run between the check runs failed', output)
    # Module by module: what check mode reports comes from the host's dry run.
    states = lab.make_states(os.path.join(lab.work, 'check-modules'), ['solo'])
    rc, recap, output = lab.playbook(lab.inventory(states, 'check-modules.json'),
                                     os.path.join(lab.source, 'tests', 'ansible', 'check.yml'))
    check(rc == 0 and recap.get('solo', {}).get('failed') == 0, 'check mode module checks failed', output)


def scenario_behaviour(lab):
    states = lab.make_states(os.path.join(lab.work, 'behaviour'), ['solo'])
    rc, recap, output = lab.playbook(lab.inventory(states, 'behaviour.json'),
                                     os.path.join(lab.source, 'tests', 'ansible', 'behaviour.yml'))
    check(rc == 0 and recap.get('solo', {}).get('failed') == 0, 'module behaviour checks failed', output)


SCENARIOS = dict(docs=scenario_docs, fleet=scenario_fleet, check=scenario_check, behaviour=scenario_behaviour)


def main():
    if len(sys.argv) != 4 or sys.argv[3] not in SCENARIOS:
        print(__doc__, file=sys.stderr)
        return 2
    autocli, source, name = os.path.abspath(sys.argv[1]), os.path.abspath(sys.argv[2]), sys.argv[3]
    for tool in ('ansible-playbook', 'ansible-doc'):
        if shutil.which(tool) is None:
            skip('%s is not installed (Debian package ansible-core; scripts/bootstrap installs it)' % tool)
    work = tempfile.mkdtemp(prefix='ansible-' + name + '-')
    keep = False
    try:
        lab = Lab(autocli, source, work)
        if name != 'docs':
            init, dry = probe(lab)
            if not init:
                skip('this autocli cannot create a state file (--init-state)')
            if name == 'check' and not dry:
                skip('this autocli has no dry run (--dry-run), which check mode runs on')
        SCENARIOS[name](lab)
    except Failure as failure:
        keep = True
        print('FAILED: %s' % failure)
        print('(work folder kept: %s)' % work)
        return 1
    finally:
        if not keep:
            shutil.rmtree(work)
    print('passed: ' + name)
    return 0


if __name__ == '__main__':
    sys.exit(main())
