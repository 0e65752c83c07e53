# SPDX-License-Identifier: Apache-2.0
"""Clients that read, and one that updates."""
import contextlib
import time

import wire
from tally import expect

CLASSES = ("Quenx_EthernetPort", "Quenx_SoftwareIdentity", "Quenx_SoftwareInstallationService", "CIM_RegisteredProfile",
           "Quenx_ConcreteJob", "CIM_ManagedElement")
NOT_FOUND = 6
BUSY = (2, 6)
TOO_OLD = 4099
UNKNOWN = 5  # quenxctl's exit status when the job cannot be looked at any more


def visit(connection, random):
    """One round of a reader, who leaves an enumeration to its time-out, too."""
    name = random.choice(CLASSES)
    paths = wire.paths_in(wire.call(connection, "EnumerateInstanceNames", name))
    yield "answered"
    expect(paths or name == "Quenx_ConcreteJob", f"there is no {name}")
    for operation, of_class in (("EnumerateInstances", name), ("OpenEnumerateInstances", "Quenx_EthernetPort")):
        wire.call(connection, operation, of_class)
        yield "answered"
    if not paths:
        return
    path = random.choice(paths)
    try:
        expect(wire.call(connection, "GetInstance", InstanceName=path).findall(".//PROPERTY"), "no properties")
        yield "answered"
    except wire.CimError as error:
        expect(error.code == NOT_FOUND and "Quenx_ConcreteJob" in path, str(error))
        yield "not there any more, a job that its client deleted"
    for operation in ("Associators", "ReferenceNames"):
        wire.call(connection, operation, ObjectName=path)
        yield "answered"


def read_often(daemon, random):
    def action(life, way):
        with contextlib.closing(wire.connect(life, way)) as connection:
            yield from visit(connection, random)

    while True:
        way = random.choice(wire.WAYS)
        daemon.step(f"reading requests over {way}", lambda life, way=way: action(life, way))
        time.sleep(random.uniform(0.1, 0.6))


def begin(daemon, life, way, adapter, file):
    """quenxctl, which follows an update that is writing now, or has been."""
    command = daemon.command(life, way, "install", "--force", "--target", adapter, file)
    while not daemon.flashes[adapter].is_being_written() and command.poll() is None:
        time.sleep(0.02)
    return command


def delete_jobs(daemon, life, way):
    for job in daemon.listed(life, "jobs"):
        status, said = daemon.finish(daemon.command(life, way, "delete", job["id"]))
        expect(status == 0, f"quenxctl delete: {said}")


def update(daemon, life, way, random, adapter=None):
    """An update to its end, sometimes with a second one beside it, or without its job."""
    adapter, file = daemon.choose(random, adapter)
    following = begin(daemon, life, way, adapter, file)
    use = random.choice(("alone", "alone", "beside", "deleted"))
    other_status = None
    if use == "beside":
        other_status, said = daemon.finish(daemon.command(life, way, "install", "--force", "--target",
                                                          *daemon.choose(random)))
        if following.poll() is None:
            expect(other_status == 1 and said["returnValue"] in BUSY, f"beside an update: {said}")
            yield "refused beside another"
    elif use == "deleted":
        delete_jobs(daemon, life, way)
    status, said = daemon.finish(following)
    limit = time.monotonic() + wire.PATIENCE
    while daemon.flashes[adapter].is_being_written():
        expect(time.monotonic() < limit, f"the update of {adapter} does not end")
        time.sleep(0.1)
    expect(status == 0 or (use == "deleted" and status == UNKNOWN), f"quenxctl install: {said}")
    # The second one may have begun as the first one ended.
    if other_status != 0:
        expect(daemon.flashes[adapter].content() == daemon.images[file], f"{adapter} has another image")
    delete_jobs(daemon, life, way)
    yield "finished" if status == 0 else "went on without its job"
    time.sleep(1)  # the claim of a deleted job goes moments after the lock of its flash


def check(daemon, life, way, random):
    adapter, file = daemon.choose(random)
    is_newer = int(file.stem) > daemon.revision_on(adapter)
    identities = {uri: each["id"] for each in daemon.listed(life, "identities") for uri in each["uris"]}
    said = daemon.finish(daemon.command(life, way, "check", "--target", adapter, "--identity",
                                        identities[f"file://{file}"]))[1]
    expect(said["returnValue"] == (0 if is_newer else TOO_OLD), f"quenxctl check: {said}")
    yield "may be installed" if is_newer else "refused as too old"


def update_often(daemon, random):
    def action(life, way, use):
        with daemon.updates:
            if not life.ended.is_set():
                yield from use(daemon, life, way, random)

    while True:
        way = random.choice(wire.WAYS)
        use = random.choice((update, update, update, check))
        daemon.step(f"{use.__name__}s over {way}", lambda life, way=way, use=use: action(life, way, use))
        time.sleep(random.uniform(0.2, 1.5))
