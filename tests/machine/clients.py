"""Stock WBEM clients that speak to the machine from outside: wbemcli, and curl with CIM-XML written by hand."""

import os
import re
import subprocess

HOST = "localhost"
NAMESPACE = "root/cimv2"
# In seconds. A client that waits for longer than this waits for a machine that is gone.
PATIENCE = 120

REQUEST = """<?xml version="1.0" encoding="utf-8"?>
<CIM CIMVERSION="2.0" DTDVERSION="2.0"><MESSAGE ID="1" PROTOCOLVERSION="1.0"><SIMPLEREQ>
<IMETHODCALL NAME="EnumerateInstanceNames"><LOCALNAMESPACEPATH><NAMESPACE NAME="root"/><NAMESPACE NAME="cimv2"/>
</LOCALNAMESPACEPATH><IPARAMVALUE NAME="ClassName"><CLASSNAME NAME="{0}"/></IPARAMVALUE></IMETHODCALL>
</SIMPLEREQ></MESSAGE></CIM>
"""


class Answer:
    """What a client said, and how it ended."""

    def __init__(self, status, text):
        self.status, self.text = status, text.strip()

    def __str__(self):
        return f"exit status {self.status}, {self.text!r}"


class Client:
    """One user of the machine, who knows its certificate."""

    def __init__(self, port, user, password, certificate):
        self._port, self._user, self._password, self._certificate = port, user, password, certificate

    def _path(self, path):
        return f"https://{self._user}:{self._password}@{HOST}:{self._port}/{path}"

    def wbemcli(self, command, path, *arguments, options=()):
        """An operation on a path as wbemcli writes it, for example `root/cimv2:CLASS`."""
        try:
            done = subprocess.run(
                ["wbemcli", command, "-cacert", self._certificate, *options, self._path(path), *arguments],
                env=dict(os.environ, LC_ALL="C"), capture_output=True, text=True, timeout=PATIENCE, check=False)
        except subprocess.TimeoutExpired:
            return Answer(-1, f"no answer within {PATIENCE} s")
        return Answer(done.returncode, done.stdout + done.stderr)

    def curl(self, class_name):
        """Asks for the instances' names of a class. The last line of the answer is HTTP's status."""
        done = subprocess.run(
            ["curl", "--silent", "--show-error", "--max-time", str(PATIENCE), "--cacert", self._certificate,
             "--user", f"{self._user}:{self._password}", "--header", "Content-Type: application/xml; charset=utf-8",
             "--header", "CIMOperation: MethodCall", "--header", "CIMMethod: EnumerateInstanceNames",
             "--header", f"CIMObject: {NAMESPACE}", "--data-binary", REQUEST.format(class_name),
             "--write-out", "\n%{http_code}\n", f"https://{HOST}:{self._port}/cimom"],
            capture_output=True, text=True, check=False)
        return Answer(done.returncode, done.stdout + done.stderr)

    # The walk from a machine to its power switch

    def _paths(self, command, path, *options):
        answer = self.wbemcli(command, path, options=options)
        if answer.status != 0:
            raise LookupError(f"{command} {path}: {answer}")
        return [re.sub(r"^[^/]*/", "", line) for line in answer.text.splitlines()]

    def system(self):
        return self._paths("ein", f"{NAMESPACE}:TALVO_ComputerSystem")[0]

    def service(self, system):
        return self._paths("ain", system, "-ac", "TALVO_AssociatedPowerManagementService")[0]

    def capabilities(self, service):
        return self._paths("ain", service, "-arr", "Capabilities")[0]

    def power_state(self):
        """The power state that the association of machine and service has; any other answer as text; else None."""
        answer = self.wbemcli("ei", f"{NAMESPACE}:TALVO_AssociatedPowerManagementService", "PowerState")
        found = re.search(r" PowerState=(\d+)$", answer.text)
        if answer.status == 0 and found:
            return int(found.group(1))
        return answer.text if "Cim: (" in answer.text or answer.status == 0 else None

    def request(self, service, system, state):
        return self.wbemcli("cm", service, f"RequestPowerStateChange.PowerState={state},ManagedElement={system}")
