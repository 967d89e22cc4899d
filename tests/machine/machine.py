"""A machine that is not this one: a Debian booted by QEMU, without acceleration by the processor, that can be driven from
outside, looked at from inside, and asked what became of it.

Nothing of it is left when it ends: what it writes to its disk goes to an overlay that has no name, and QEMU ends with the
program that started it. Of this machine it has one port of the loopback address.
"""

import base64
import json
import os
import re
import socket
import subprocess
import time

# Limits in seconds for a machine that is emulated on a busy host: they end what hangs, and measure nothing.
BOOT_PATIENCE = 900
PATIENCE = 900
PAUSE = 1

PACKAGES_SIZE = 128 * 2**20


class MachineError(Exception):
    """The machine did not do what was expected of it."""


def wait_until(what, condition, patience=PATIENCE):
    """Returns what the condition gives as soon as it is true."""
    deadline = time.monotonic() + patience
    while True:
        result = condition()
        if result:
            return result
        if time.monotonic() > deadline:
            raise MachineError(f"{what}: not within {patience} s")
        time.sleep(PAUSE)


class Result:
    """What a command did: its exit status, and what it printed, standard error included."""

    def __init__(self, command, status, output):
        self.command, self.status, self.output = command, status, output

    def __str__(self):
        return f"`{self.command}` ended with {self.status} and printed:\n{self.output}"


class JsonSocket:
    """Lines of JSON over a socket of the file system."""

    def __init__(self, path, patience):
        self._socket = socket.socket(socket.AF_UNIX)
        self._socket.settimeout(patience)
        self._socket.connect(path)
        self._received = b""

    def close(self):
        self._socket.close()

    def send(self, message, before=b""):
        self._socket.sendall(before + json.dumps(message).encode() + b"\n")

    def receive(self, patience=None):
        """The next message; None if none comes in time."""
        deadline = None if patience is None else time.monotonic() + patience
        while b"\n" not in self._received:
            if deadline is not None:
                self._socket.settimeout(max(deadline - time.monotonic(), 0.001))
            try:
                more = self._socket.recv(65536)
            except TimeoutError:
                return None
            if not more:
                raise MachineError("QEMU closed the connection")
            self._received += more
        line, self._received = self._received.split(b"\n", 1)
        # What an earlier conversation left unsaid ends with this byte.
        return json.loads(line.rsplit(b"\xff", 1)[-1])


class Machine:
    """Booted when it is made; switched off when it is left as a context."""

    GUEST_PORT = 5989

    def __init__(self, architecture, image, packages, folder):
        """With the image's folder, that of the packages, which it has as a second disk, and a folder for what QEMU makes."""
        self._console = os.path.join(folder, "console")
        self._agent_path = os.path.join(folder, "agent")
        self._events = []
        disk = os.path.join(folder, "packages")
        with open(disk, "wb") as file:
            file.truncate(PACKAGES_SIZE)
        subprocess.run(["mke2fs", "-q", "-t", "ext4", "-d", packages, disk], check=True)
        qmp = os.path.join(folder, "qmp")
        program = {"amd64": "qemu-system-x86_64", "i386": "qemu-system-i386"}[architecture]
        self._process = subprocess.Popen([
            "setpriv", "--pdeathsig", "KILL", program,
            "-machine", "q35", "-accel", "tcg", "-smp", "2", "-m", "768",
            "-nodefaults", "-no-user-config", "-display", "none", "-no-shutdown",
            "-kernel", os.path.join(image, "vmlinuz"), "-initrd", os.path.join(image, "initrd"),
            "-append", "root=/dev/vda rw console=ttyS0 panic=-1",
            "-drive", f"if=virtio,format=raw,snapshot=on,cache=unsafe,file={image}/disk",
            "-drive", f"if=virtio,format=raw,readonly=on,file={disk}",
            "-netdev", f"user,id=net,restrict=on,hostfwd=tcp:127.0.0.1:0-10.0.2.15:{self.GUEST_PORT}",
            "-device", "virtio-net-pci,netdev=net,romfile=", "-device", "virtio-rng-pci", "-device", "virtio-serial-pci",
            "-serial", f"file:{self._console}",
            "-chardev", f"socket,id=agent,path={self._agent_path},server=on,wait=off",
            "-device", "virtserialport,chardev=agent,name=org.qemu.guest_agent.0",
            "-qmp", f"unix:{qmp},server=on,wait=off"])
        try:
            wait_until("QEMU started", lambda: os.path.exists(qmp) or self._process.poll() is not None, 60)
            if self._process.poll() is not None:
                raise MachineError(f"QEMU ended with {self._process.returncode}")
            self._qmp = JsonSocket(qmp, PATIENCE)
            self._qmp.receive()
            self._ask_qmp("qmp_capabilities")
            network = self._ask_qmp("human-monitor-command", **{"command-line": "info usernet"})
            self.port = int(re.search(r"HOST_FORWARD.*?127\.0\.0\.1\s+(\d+)\s+10\.0\.2\.15", network).group(1))
        except BaseException:
            self._end()
            raise

    def __enter__(self):
        return self

    def __exit__(self, *_):
        self._end()

    def _end(self):
        self._process.kill()
        self._process.wait()

    def _ask_qmp(self, command, **arguments):
        self._qmp.send({"execute": command, "arguments": arguments})
        while True:
            message = self._qmp.receive()
            if "event" in message:
                self._events.append(message)
            elif "error" in message:
                raise MachineError(f"QEMU refused {command}: {message['error']['desc']}")
            else:
                return message["return"]

    def wait_for_event(self, name, patience=PATIENCE):
        """What the guest did to the machine, for example RESET. Returns when, as time.time() has it."""
        deadline = time.monotonic() + patience
        while True:
            for event in self._events:
                if event["event"] == name and event["data"].get("guest"):
                    self._events.remove(event)
                    return event["timestamp"]["seconds"] + event["timestamp"]["microseconds"] / 1e6
            message = self._qmp.receive(max(deadline - time.monotonic(), 0))
            if message is None:
                raise MachineError(f"no event {name} of the guest within {patience} s")
            self._events.append(message)

    def has_happened(self, name):
        """Whether such an event has come that nobody has waited for."""
        self._ask_qmp("query-status")
        return any(event["event"] == name for event in self._events)

    def switch_on(self):
        """After the guest has switched the machine off."""
        self._ask_qmp("system_reset")
        self._ask_qmp("cont")

    def report(self, unit, to):
        """Writes what helps to find out why something failed: what the machine has shown last, and a unit's journal."""
        with open(self._console, errors="replace") as file:
            print(f"The end of the console:\n{file.read()[-2000:]}", file=to)
        if self._answers(60):
            print(self.run(f"systemctl status --no-pager {unit}; journalctl --no-pager --boot --unit {unit} --lines 50").output,
                  file=to)

    # From inside

    def _agent(self, patience):
        """A conversation with the guest agent; None if it does not answer in time."""
        agent = JsonSocket(self._agent_path, patience)
        number = time.monotonic_ns() % 2**31
        try:
            agent.send({"execute": "guest-sync-delimited", "arguments": {"id": number}}, before=b"\xff")
            deadline = time.monotonic() + patience
            while time.monotonic() < deadline:
                answer = agent.receive(deadline - time.monotonic())
                if answer is not None and answer.get("return") == number:
                    return agent
        except (OSError, ValueError, MachineError):
            pass
        agent.close()
        return None

    def wait_until_up(self):
        """Until commands can be run inside."""
        wait_until("the guest agent answers", lambda: self._answers(30), BOOT_PATIENCE)

    def _answers(self, patience):
        agent = self._agent(patience)
        if agent is not None:
            agent.close()
        return agent is not None

    def run(self, command, typed="", patience=PATIENCE):
        """A command line of bash, run inside as root in the folder with the packages; `typed` is its standard input."""
        agent = self._agent(PATIENCE)
        if agent is None:
            raise MachineError(f"the guest agent does not answer; not run: {command}")
        try:
            def ask(name, **arguments):
                agent.send({"execute": name, "arguments": arguments})
                answer = agent.receive(PATIENCE)
                if answer is None or "error" in answer:
                    raise MachineError(f"{command}: the guest agent answers {answer}")
                return answer["return"]

            started = ask("guest-exec", path="/bin/bash",
                          arg=["-c", f"exec 2>&1; mkdir -p /root/source && cd /root/source; {command}"],
                          env=["HOME=/root", "LANG=C.UTF-8", "TERM=dumb",
                               "PATH=/usr/local/sbin:/usr/local/bin:/usr/sbin:/usr/bin:/sbin:/bin"],
                          **{"input-data": base64.b64encode(typed.encode()).decode(), "capture-output": True})
            status = wait_until(command, lambda: self._exited(ask, started["pid"]), patience)
        finally:
            agent.close()
        output = base64.b64decode(status.get("out-data", "")).decode(errors="replace")
        return Result(command, status.get("exitcode", -status.get("signal", 0)), output)

    @staticmethod
    def _exited(ask, process):
        status = ask("guest-exec-status", pid=process)
        return status if status["exited"] else None
