"""Seconds and memory of commands that compare files."""

import functools
import multiprocessing
import os
import re
import subprocess
import time


def in_another_process(function, *arguments):
    """Calls a function that writes files, as a command begins with the memory of what runs it, and
    waits until they are on the disk, as writing them would slow the commands."""
    writer = multiprocessing.get_context("fork").Process(target=function, args=arguments)
    writer.start()
    writer.join()
    assert writer.exitcode == 0, "the files could not be written"
    os.sync()


def seconds_of(command):
    """What a program of Python after -c prints, otherwise those of the whole command."""
    begin = time.perf_counter()
    output = subprocess.run(command, check=True, stdout=subprocess.PIPE).stdout
    seconds = time.perf_counter() - begin
    return float(output) if "-c" in command else seconds


def memory_of(command):
    """The greatest resident memory in bytes, as seen while the command runs."""
    most = 0
    with subprocess.Popen(command, stdout=subprocess.DEVNULL) as process:
        while process.poll() is None:
            with open(f"/proc/{process.pid}/status", encoding="utf-8") as status:
                found = re.search(r"VmHWM:\s+(\d+) kB", status.read())
            most = max(most, 1024 * int(found.group(1)) if found else 0)
            time.sleep(0.001)
    if process.returncode != 0:
        raise subprocess.CalledProcessError(process.returncode, command)
    return most


def in_turns(calls, repetitions):
    """What each function returns in all repetitions, by name; in turns, so that other work of the
    machine affects all of them."""
    returned = {name: [] for name in calls}
    for _ in range(repetitions):
        for name, call in calls.items():
            returned[name].append(call())
    return returned


def measured_in_turns(commands, repetitions):
    """The least seconds and the memory of each command, by name; all of them have to succeed."""
    memory = {name: memory_of(command) for name, command in commands.items()}
    calls = {name: functools.partial(seconds_of, command) for name, command in commands.items()}
    seconds = in_turns(calls, repetitions)
    return {name: {"seconds": min(seconds[name]), "memory": memory[name]} for name in commands}
