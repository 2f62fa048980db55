#!/usr/bin/python
from __future__ import absolute_import, division, print_function

__metaclass__ = type

DOCUMENTATION = r'''
module: kz7_copies
short_description: Add, move and remove installed copies of KZ7
description:
  - Makes the copies as a list says, by C(kz7admin ensure). On Linux all of it is one transaction.
  - In check mode nothing changes, and the result is what would change. Diff mode shows each row.
  - What stays otherwise than one may expect is a warning.
options:
  copies:
    description: The copies.
    type: list
    elements: dict
    required: true
    suboptions:
      name:
        description: The name of the copy.
        type: str
        required: true
      location:
        description: Its directory. Required unless the copy is absent.
        type: str
      state:
        description: Whether the copy is installed.
        type: str
        choices: [present, absent]
        default: present
  prune:
    description: Remove the copies that the list does not have.
    type: bool
    default: false
  prune_all:
    description: With I(prune), remove the last copy too, and with it the whole product.
    type: bool
    default: false
  services:
    description: Correct services that belong to another location.
    type: bool
    default: false
extends_documentation_fragment: kz7.install.kz7admin
author: the maintainers of kz7install
'''

EXAMPLES = r'''
- name: Two copies and no old one
  kz7.install.kz7_copies:
    copies:
      - name: COPY1
        location: C:\KZ7\copy1
      - name: COPY2
        location: C:\KZ7\copy2
      - name: OLD
        state: absent
'''

RETURN = r'''
changes:
  description: Each row that changed, or would change, as C(kz7admin ensure --json) writes it.
  type: list
  elements: dict
  returned: success
notes:
  description: What stays otherwise than one may expect.
  type: list
  elements: str
  returned: success
status:
  description: The status of the run, 0 for success.
  type: int
  returned: always
'''

import json
import os

from ansible.module_utils.basic import AnsibleModule
from ansible_collections.kz7.install.plugins.module_utils.kz7admin import ARGUMENTS, run_change


def main():
    module = AnsibleModule(
        argument_spec=dict(
            ARGUMENTS,
            copies=dict(type='list', elements='dict', required=True, options=dict(
                name=dict(type='str', required=True),
                location=dict(type='str'),
                state=dict(type='str', choices=['present', 'absent'], default='present'))),
            prune=dict(type='bool', default=False),
            prune_all=dict(type='bool', default=False),
            services=dict(type='bool', default=False)),
        supports_check_mode=True)
    wanted = [{field: value for field, value in copy.items() if value is not None} for copy in module.params['copies']]
    # Not on standard input, which an older kz7admin does not read.
    path = os.path.join(module.tmpdir, 'copies.json')
    with open(path, 'w') as file:
        json.dump({'copies': wanted}, file)
    command = ['ensure', '--from', path]
    for parameter, option in (('prune', '--prune'), ('prune_all', '--all'), ('services', '--services')):
        if module.params[parameter]:
            command.append(option)
    code, run, result = run_change(module, command)
    if code != 0:
        module.fail_json(msg='; '.join(error['text'] for error in run['errors']) or 'kz7admin ensure failed', **result)
    module.exit_json(**result)


if __name__ == '__main__':
    main()
