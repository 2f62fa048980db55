"""Runs kz7admin and maps its JSON to the result of a module."""
from __future__ import absolute_import, division, print_function

__metaclass__ = type

import json
import os

# The first version with everything that the modules use.
NEEDED = '1.0.0'

LOCKED = 170  # another program held the store for 5 seconds
ATTEMPTS = 3

ARGUMENTS = {
    'executable': {'type': 'path', 'default': '/usr/bin/kz7admin'},
    'store': {'type': 'path'},
}


def parsed(text):
    """The object that kz7admin wrote, or an empty one."""
    try:
        value = json.loads(text)
    except (ValueError, RuntimeError):
        return {}
    return value if isinstance(value, dict) and value.get('schema') == 1 else {}


def run_kz7admin(module, command, names=()):
    """Returns the exit code and the object that the command wrote; fails if it could not do its work.

    `names` come from the user and are no options, whatever they begin with.
    """
    program = module.params['executable']
    if not os.path.isfile(program) or not os.access(program, os.X_OK):
        module.fail_json(msg='%s is not there: install the package kz7install, version %s or newer' % (program, NEEDED))
    words = [program, '--at-least', NEEDED]
    if module.params['store']:
        words += ['--store', module.params['store']]
    for attempt in range(ATTEMPTS):
        code, output, error = module.run_command(words + command + ['--json', '--'] + list(names))
        result = parsed(output)
        fault = parsed(error)
        if LOCKED not in (result.get('status'), fault.get('status')):
            break
    if result and code in (0, 1):
        return code, result
    if fault:
        tries = ' (%d attempts)' % ATTEMPTS if fault.get('status') == LOCKED else ''
        module.fail_json(msg='kz7admin: %s%s' % (fault.get('error'), tries), rc=code)
    # A version that is new enough reports a wrong command line (2) in JSON too.
    reason = 'is older than %s, which kz7.install needs' % NEEDED if code == 2 else 'ended with %d' % code
    module.fail_json(msg='%s %s: %s' % (program, reason, error.strip()), rc=code)


def run_change(module, command, names=()):
    """The same for a command that changes the store. Honours check mode and diff mode; notes become warnings."""
    options = ['--check'] * module.check_mode + ['--diff'] * module._diff
    code, run = run_kz7admin(module, command + options, names)
    for note in run['notes']:
        module.warn(note)
    result = {'changed': run['changed'], 'changes': run['changes'], 'notes': run['notes'], 'status': run['status']}
    if module._diff and run['changed']:
        result['diff'] = {'prepared': run['diff']}
    return code, run, result
