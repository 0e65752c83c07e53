#!/usr/bin/python
# SPDX-License-Identifier: Apache-2.0
"""Brings adapters to the firmware of images; all the work is that of quenxctl."""

from __future__ import absolute_import, division, print_function

__metaclass__ = type

DOCUMENTATION = r"""
---
module: firmware
short_description: Updates the firmware of Ethernet adapters
description:
  - Installs firmware images on the Ethernet adapters of a machine with C(quenxctl), one adapter after the other, each
    card once. What is on an adapter already is not written again.
  - Never resets or restarts anything. C(reboot_required) tells that new firmware waits for it.
  - Where an update of an adapter runs already, because an earlier run lost its connection, its end is waited for.
author:
  - The Quenx authors (@quenx)
options:
  images:
    description: The images, as paths on the machine on which the task runs.
    type: list
    elements: str
    required: true
    aliases: [image]
  match:
    description: Only adapters whose name or PCI address matches this pattern of a shell, such as C(eth*).
    type: str
  fit:
    description:
      - Only adapters that an image is made for, and that can be updated. Without it an adapter that does not take the
        image is a failure, and there can be but one image.
    type: bool
    default: true
  force:
    description: Also install what is older, the same again, or cannot be compared.
    type: bool
    default: false
  keep_going:
    description: Go on with the next adapter after a failure. The task fails in any case.
    type: bool
    default: false
  confirm:
    description: Adapters that are hardware are written to only with this, or with C(backend=devlink).
    type: bool
    default: false
  backend:
    description: Which adapters are meant, those of the machine itself or simulated ones. Not with C(server).
    type: str
    choices: [auto, devlink, simulator]
  server:
    description:
      - The URL of an object manager to use, C(https://host:5989), instead of the machine that the task runs on; delegate
        the task to a machine that can reach it. The images are sent to it first.
    type: str
  user:
    description: The user on the server.
    type: str
  password:
    description: The password of the user.
    type: str
  ca_file:
    description: The certificates to trust instead of those of the system.
    type: path
  executable:
    description: The program, where it is not in the search path.
    type: str
    default: quenxctl
attributes:
  check_mode:
    description: Says what would be installed, as far as that can be told without writing.
    support: full
  diff_mode:
    description: Shows the versions in the flash before and after.
    support: full
"""

EXAMPLES = r"""
- name: Bring all adapters to the newest firmware
  quenx.adapters.firmware:
    images:
      - /srv/firmware/qx10-2.rom
      - /srv/firmware/qx25-7.rom
    backend: devlink
  register: firmware

- name: Update an adapter of a machine that is reached through its object manager
  quenx.adapters.firmware:
    images: /srv/firmware/qx10-2.rom
    match: eth0
    server: "https://{{ inventory_hostname }}"
    user: admin
    password: "{{ vault_password }}"
    confirm: true
  delegate_to: localhost
"""

RETURN = r"""
adapters:
  description: What became of each adapter, a card once.
  returned: always
  type: list
  elements: dict
  contains:
    name:
      description: The adapter.
      type: str
    outcome:
      description: One of C(current), C(updated), C(updated-reset-pending), C(refused), C(failed), C(unknown), and in check
        mode C(installable).
      type: str
    message:
      description: What happened, and what to do.
      type: str
    before:
      description: The versions in the flash before.
      type: dict
    after:
      description: The versions in the flash now, or in check mode as they would be.
      type: dict
    reset_needed:
      description: What it takes until they run, C(none), C(reload), C(reboot), C(power cycle) or C(unknown).
      type: str
    reason_id:
      description: The id of the reason of a refusal or failure.
      type: str
    job:
      description: The id of the job.
      type: str
    history_id:
      description: The number of the record in the history of the machine.
      type: int
reboot_required:
  description: New firmware waits for a reset of an adapter, from this run or an earlier one.
  returned: always
  type: bool
same_card:
  description: Adapters that are functions of a card of which another one was updated.
  returned: always
  type: list
  elements: str
not_tried:
  description: Adapters that were left out after a failure.
  returned: always
  type: list
  elements: str
unused:
  description: Images that are for no adapter here. The task fails when none of them is for any.
  returned: always
  type: list
  elements: str
"""

import json

from ansible.module_utils.basic import AnsibleModule

OPTIONS = {
    "images": {"type": "list", "elements": "str", "required": True, "aliases": ["image"]},
    "match": {"type": "str"},
    "fit": {"type": "bool", "default": True},
    "force": {"type": "bool", "default": False},
    "keep_going": {"type": "bool", "default": False},
    "confirm": {"type": "bool", "default": False},
    "backend": {"type": "str", "choices": ["auto", "devlink", "simulator"]},
    "server": {"type": "str"},
    "user": {"type": "str"},
    "password": {"type": "str", "no_log": True},
    "ca_file": {"type": "path"},
    "executable": {"type": "str", "default": "quenxctl"},
}
VALUES = {"backend": "--backend", "server": "--server", "user": "--user", "ca_file": "--cacert", "match": "--match"}
FLAGS = {"fit": "--fit", "force": "--force", "keep_going": "--keep-going", "confirm": "--yes"}
FAILURES = ("refused", "failed", "unknown")
CHANGES = ("updated", "updated-reset-pending", "installable")


def command_of(params, check_mode):
    command = [params["executable"], "--json", "install", "--follow"]
    for name, option in VALUES.items():
        if params[name]:
            command += [option, params[name]]
    command += [option for name, option in FLAGS.items() if params[name]]
    # A path on the server would be one of which nothing can be told from here.
    if params["server"]:
        command.append("--upload")
    if not params["fit"] and not params["match"]:
        command.append("--all")
    if check_mode:
        command.append("--dry-run")
    return command + ["--"] + params["images"]


def versions(components):
    return dict((each["type"], each.get("stored") or each.get("text") or str(each["version"])) for each in components)


def adapter_of(result):
    return {
        "name": result["adapter"],
        "outcome": result["outcome"],
        "message": " ".join(text for text in (result["message"], result["advice"]) if text),
        "before": versions(result["before"]),
        "after": versions(result["after"]),
        "reset_needed": result["resetNeeded"],
        "reason_id": result.get("reasonId"),
        "job": (result["job"] or {}).get("id"),
        "history_id": result.get("historyId"),
    }


def text_of(adapters, when):
    lines = []
    for adapter in adapters:
        for name, version in sorted(adapter[when].items()):
            lines.append("%s %s %s\n" % (adapter["name"], name, version))
    return "".join(lines)


def results_of(document):
    adapters = [adapter_of(result) for result in document["results"]]
    return {
        "changed": any(adapter["outcome"] in CHANGES for adapter in adapters),
        "adapters": adapters,
        "reboot_required": any(result["resetPending"] for result in document["results"]),
        "same_card": [function["adapter"] for function in document["sameCard"]],
        "not_tried": document["notTried"],
        "unused": document["unused"],
        "diff": {"before": text_of(adapters, "before"), "after": text_of(adapters, "after")},
    }


def main():
    module = AnsibleModule(argument_spec=OPTIONS, supports_check_mode=True)
    # On the command line every user of the machine could read it.
    environment = {"QUENXCTL_PASSWORD": module.params["password"]} if module.params["password"] else {}
    status, output, errors = module.run_command(
        command_of(module.params, module.check_mode), environ_update=environment
    )
    try:
        document = json.loads(output)
    except ValueError:
        module.fail_json(msg="quenxctl ended with status %d and no result, so what it did is unknown." % status,
                         stdout=output, stderr=errors)
    if "error" in document:
        module.fail_json(msg=" ".join((document["error"], document["advice"])).strip(), rc=status,
                         reason_id=document.get("reasonId"))
    results = results_of(document)
    failed = [each["name"] + ": " + each["message"] for each in results["adapters"] if each["outcome"] in FAILURES]
    if failed or results["not_tried"]:
        module.fail_json(msg="\n".join(failed or ["Interrupted."]), **results)
    if results["unused"] and not results["adapters"]:
        module.fail_json(msg="No adapter takes " + ", ".join(results["unused"]) + ".", **results)
    module.exit_json(**results)


if __name__ == "__main__":
    main()
