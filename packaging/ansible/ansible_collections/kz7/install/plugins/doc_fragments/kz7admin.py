from __future__ import absolute_import, division, print_function

__metaclass__ = type


class ModuleDocFragment(object):
    DOCUMENTATION = r'''
options:
  executable:
    description: The program to run on the machine. It is never searched for.
    type: path
    default: /usr/bin/kz7admin
  store:
    description: The state directory to use instead of the usual one. Not on Windows.
    type: path
requirements:
  - kz7admin 1.0.0 or newer on the machine. An older one does nothing, and the task fails with the version needed.
notes:
  - A store that another program holds (status 170) is tried three times; kz7admin waits 5 seconds each time.
'''
