"""python-dbusmock's mock of systemd-logind, extended by scheduled shutdowns and by calls that fail.

Parameters, beside those of the template that it extends:

ScheduledShutdown   type and time that stand there from the beginning
PropertiesError     [name, message] with which reading any property fails
Inhibitors          list of [what, who, why, mode, uid, pid]
Calls               what a method does in place of its work:
                      {"error": [name, message]}   fails
                      {"delay": seconds}           takes that long, then does its work
                      {"exit": true}               ends the service
                      {"kill": pid}                ends a process, such as the bus
"""

import dbus

from dbusmock import mockobject
from dbusmock.templates import logind
from dbusmock.templates.logind import BUS_NAME, MAIN_IFACE, MAIN_OBJ, SYSTEM_BUS, ListInhibitors  # noqa: F401

# python-dbusmock runs these as the bodies of methods.
SCHEDULE = """
self.props[self.interface]["ScheduledShutdown"] = dbus.Struct((args[0], dbus.UInt64(args[1])), signature="st")
"""
CANCEL = """
ret = self.props[self.interface]["ScheduledShutdown"][0] != ""
self.props[self.interface]["ScheduledShutdown"] = dbus.Struct(("", dbus.UInt64(0)), signature="st")
"""
GO_DOWN = """
self.props[self.interface]["PreparingForShutdown"] = dbus.Boolean(True)
"""


class Unreadable(dict):
    """Properties that cannot be read."""

    def __init__(self, name, message):
        super().__init__()
        self.name = name
        self.message = message

    def __getitem__(self, key):
        raise dbus.exceptions.DBusException(self.message, name=self.name)


def code_of(method, work, calls):
    """The code of a method: that of a working one, or what a test asks for instead."""
    call = calls.get(method, {})
    if "error" in call:
        name, message = call["error"]
        return f"raise dbus.exceptions.DBusException({message!r}, name={name!r})"
    if "exit" in call:
        return "os._exit(0)"
    if "kill" in call:
        return f"os.kill({int(call['kill'])}, 9); time.sleep(60)"
    if "delay" in call:
        return f"time.sleep({float(call['delay'])})\n{work}"
    return work


def load(mock, parameters):
    """Called by python-dbusmock."""
    logind.load(mock, parameters)
    mockobject.inhibitors = dbus.Array(
        [(what, who, why, mode, dbus.UInt32(uid), dbus.UInt32(pid))
         for what, who, why, mode, uid, pid in parameters.get("Inhibitors", [])],
        signature="(ssssuu)")
    shutdown_type, time = parameters.get("ScheduledShutdown", ["", 0])
    mock.AddProperty(MAIN_IFACE, "ScheduledShutdown",
                     dbus.Struct((shutdown_type, dbus.UInt64(time)), signature="st"))
    methods = {
        "Reboot": ("b", "", GO_DOWN),
        "PowerOff": ("b", "", GO_DOWN),
        "ScheduleShutdown": ("st", "", SCHEDULE),
        "CancelScheduledShutdown": ("", "b", CANCEL),
    }
    for can in ("CanReboot", "CanPowerOff", "CanSuspend", "CanHibernate"):
        methods[can] = ("", "s", f"ret = {parameters.get(can, 'yes')!r}")
    if "PropertiesError" in parameters:
        mock.props[MAIN_IFACE] = Unreadable(*parameters["PropertiesError"])
    calls = parameters.get("Calls", {})
    mock.AddMethods(MAIN_IFACE, [(name, given, returned, code_of(name, work, calls))
                                 for name, (given, returned, work) in methods.items()])
