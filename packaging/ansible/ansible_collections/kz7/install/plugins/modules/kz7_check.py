#!/usr/bin/python
from __future__ import absolute_import, division, print_function

__metaclass__ = type

DOCUMENTATION = r'''
module: kz7_check
short_description: Report what is not in order with the installed copies of KZ7, and repair it
description:
  - Returns the findings of C(kz7admin check). Nothing changes.
  - With I(repair), runs C(kz7admin repair) instead and returns its changes. Check mode and diff mode are supported.
options:
  repair:
    description: Repair what is not in order.
    type: bool
    default: false
  kinds:
    description:
      - With I(repair), the kinds of findings or their groups (aliases, copies, services, properties).
      - Without any, all but services and migration.
    type: list
    elements: str
    default: []
  copy:
    description: Only what belongs to this copy.
    type: str
  all:
    description: Without I(repair), also what is deliberate or not installed yet.
    type: bool
    default: false
  fail:
    description: Fail if something is not in order, or could not be repaired.
    type: bool
    default: false
extends_documentation_fragment: kz7.install.kz7admin
author: the maintainers of kz7install
'''

EXAMPLES = r'''
- name: Is the machine in order?
  kz7.install.kz7_check:
    fail: true

- name: Repair aliases and services
  kz7.install.kz7_check:
    repair: true
    kinds: [aliases, services]
'''

RETURN = r'''
findings:
  description: Each finding with kind, mark, copy, subject, what, why and repair.
  type: list
  elements: dict
  returned: without repair
in_order:
  description: Whether no finding is a fault; with repair, whether everything could be repaired.
  type: bool
  returned: success
changes:
  description: Each row that changed, or would change.
  type: list
  elements: dict
  returned: with repair
notes:
  description: What could not be repaired.
  type: list
  elements: str
  returned: with repair
'''

from ansible.module_utils.basic import AnsibleModule
from ansible_collections.kz7.install.plugins.module_utils.kz7admin import ARGUMENTS, run_change, run_kz7admin


def main():
    module = AnsibleModule(
        argument_spec=dict(
            ARGUMENTS,
            repair=dict(type='bool', default=False),
            kinds=dict(type='list', elements='str', default=[]),
            copy=dict(type='str'),
            all=dict(type='bool', default=False),
            fail=dict(type='bool', default=False)),
        supports_check_mode=True)
    copy = module.params['copy']
    if module.params['repair']:
        code, run, result = run_change(module, ['repair'] + (['--copy=' + copy] if copy else []),
                                       names=module.params['kinds'])
        texts = run['notes']
    else:
        code, run = run_kz7admin(module, ['check'] + ['--all'] * module.params['all'], names=[copy] if copy else [])
        result = {'changed': False, 'findings': run['findings']}
        texts = ['%(what)s: %(why)s' % finding for finding in run['findings'] if finding['mark'] == 'fault']
    result['in_order'] = code == 0
    if code != 0 and module.params['fail']:
        module.fail_json(msg='; '.join(texts), **result)
    module.exit_json(**result)


if __name__ == '__main__':
    main()
