#!/usr/bin/python
from __future__ import absolute_import, division, print_function

__metaclass__ = type

DOCUMENTATION = r'''
module: kz7_facts
short_description: Collect facts about the installed copies of KZ7
description:
  - Returns what C(kz7admin facts) writes as the fact C(kz7). C(kz7admin report --fleet) makes one page of the facts of many
    machines.
extends_documentation_fragment: kz7.install.kz7admin
author: the maintainers of kz7install
'''

EXAMPLES = r'''
- name: Collect facts
  kz7.install.kz7_facts:

- name: Show the location of each copy
  ansible.builtin.debug:
    msg: "{{ item.name }} is at {{ item.location }}"
  loop: "{{ ansible_facts.kz7.copies | selectattr('view', 'eq', 'native') }}"
'''

RETURN = r'''
ansible_facts:
  description: The facts.
  type: dict
  returned: always
  contains:
    kz7:
      description: Copies, aliases, services, findings, host and the versions of our programs.
      type: dict
      returned: always
'''

from ansible.module_utils.basic import AnsibleModule
from ansible_collections.kz7.install.plugins.module_utils.kz7admin import ARGUMENTS, run_kz7admin


def main():
    module = AnsibleModule(argument_spec=dict(ARGUMENTS), supports_check_mode=True)
    code, facts = run_kz7admin(module, ['facts'])
    module.exit_json(changed=False, ansible_facts={'kz7': facts})


if __name__ == '__main__':
    main()
