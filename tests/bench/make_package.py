#!/usr/bin/env python3
"""Makes a plain archive of a collection of a large machine: 50,000 events, 400 processes, and what goes with them.

usage: make_package.py FILE [EVENTS [PROCESSES]]
"""
import hashlib
import json
import os
import random
import sys
import time
import zipfile

from make_corpus import LANGUAGE, MODULES, path

COLLECTED_AT = 1_709_553_600  # 2024-03-04T12:00:00Z
UTC_OFFSET = 3600  # of the machine's local time, which the events have
SOURCES = ("Application Error", "MsiInstaller", "Service Control Manager", "disk", "Microsoft-Windows-Security-SPP", "ESENT",
           "Windows Error Reporting", "Microsoft-Windows-Kernel-General", "VSS", "Quorvex Engine")
HANDLE_TYPES = ("File", "Key", "Event", "Section", "Thread", "Mutant", "Semaphore", "Token")


def md5(rng):
    return hashlib.md5(rng.randbytes(8)).hexdigest()


def event_log(rng, count):
    clock, events = COLLECTED_AT + UTC_OFFSET, []
    for _ in range(count):
        clock -= rng.randrange(1, 100)
        when = time.gmtime(clock)
        event = {"Computername": "DESKTOP-4711", "EventType": rng.choice("1244444"), "SourceName": rng.choice(SOURCES),
                 "TimeGenerated": f"{when.tm_mon}/{when.tm_mday}/{when.tm_year} {time.strftime('%H:%M:%S', when)}",
                 "InsertionStrings": [LANGUAGE.message(rng) for _ in range(rng.randrange(4))]}
        if rng.random() < 0.8:
            event["message"] = LANGUAGE.message(rng) + ".\r\n"
        events.append(event)
    return events


def processes(rng, count):
    found = []
    for index in range(count):
        executable = path(rng)
        found.append({
            "Name": executable.rsplit("\\", 1)[1], "ProcessId": 4 * index + 4,
            "ParentProcessId": 4 * rng.randrange(max(index, 1)) + 4, "ExecutablePath": executable,
            "CommandLine": f"\"{executable}\" {LANGUAGE.sentence(rng, 1, 8)}", "Description": LANGUAGE.sentence(rng, 1, 4),
            "Priority": 8, "User": "NT AUTHORITY\\SYSTEM" if index % 3 else "DESKTOP-4711\\anna", "imageType": "x32",
            "signed": index % 10 != 0, "md5": md5(rng), "modules": [{"name": path(rng)} for _ in range(60)],
            "handles": [{"name": "", "type": rng.choice(HANDLE_TYPES), "value": f"[0x{4 * i:x}]"} for i in range(1, 250)]})
    return found


def registry_key(rng, depth):
    key = {"values": {LANGUAGE.sentence(rng, 1, 2): LANGUAGE.message(rng) for _ in range(8)}}
    if depth:
        key["subkeys"] = {f"{LANGUAGE.sentence(rng, 1, 3)} {i}": registry_key(rng, depth - 1) for i in range(6)}
    return key


def documents(events, process_count):
    rng = random.Random(6)
    product = "C:\\Program Files\\Quorvex"
    services = [{"Name": f"svc{i}", "DisplayName": LANGUAGE.sentence(rng, 2, 5), "State": rng.choice(("Running", "Stopped")),
                 "StartMode": rng.choice(("Auto", "Manual")), "ServiceType": "Own Process", "PathName": path(rng),
                 "StartName": "LocalSystem"} for i in range(300)]
    drivers = [{"Name": f"drv{i}", "Description": LANGUAGE.sentence(rng, 2, 5), "State": "Running", "StartMode": "Boot",
                "PathName": path(rng), "ServiceType": "Kernel Driver", "Started": -1, "AcceptPause": 0, "AcceptStop": -1}
               for i in range(400)]
    written = {
        "system_summary": {"System Name": "DESKTOP-4711", "System Manufacturer": "Contoso", "System Model": "Tower 5",
                           "OS Name": "Microsoft Windows 11 Pro", "OS Version": "10.0.22631", "CPU Name": "Processor",
                           "Windows Directory": "C:\\Windows", "System Type": "x64-based PC",
                           "Time Zone": "(UTC+01:00) Somewhere", "Installed Physical Memory": 17_179_869_184.0,
                           "Available Physical Memory": 600_000_000.0},
        "storage": {"Disks": [{"Model": "SSD", "Partitions": 3, "BytesPerSector": 512}],
                    "Partitions": [{"Drive Letter": "C:", "File System": "NTFS", "Size": "511101108224",
                                    "Free Space": "21474836480", "VolumeName": "System", "VolumeSerialNumber": "12345678"},
                                   {"Drive Letter": "D:", "File System": "NTFS", "Size": "1000202039296",
                                    "Free Space": "700000000000", "VolumeName": "Data", "VolumeSerialNumber": "87654321"}]},
        "running_tasks": {"processes": processes(rng, process_count)},
        "windows_events": {"Application": event_log(rng, events // 2), "System": event_log(rng, events - events // 2)},
        "services": services, "system_drivers": drivers,
        "startup_programs": [{"key": "HKEY_LOCAL_MACHINE\\SOFTWARE\\Microsoft\\Windows\\CurrentVersion\\Run",
                              "name": f"entry {i}", "value": path(rng)} for i in range(60)],
        "installed_software": [{"Name": LANGUAGE.sentence(rng, 1, 4), "Version": f"{i}.{i * 7 % 30}",
                                "Publisher": LANGUAGE.sentence(rng, 1, 3),
                                "InstallDate": f"202{i % 4}{1 + i % 12:02}{1 + i % 28:02}"} for i in range(200)]
                              + [{"Name": "Quorvex Security", "Version": "7.2.1", "Publisher": "Quorvex", "InstallDate": "20240115"}],
        "installed_updates": [{"Name": f"Update (KB{500_000 + i})", "Program": LANGUAGE.sentence(rng, 1, 3),
                               "InstallDate": f"202{i % 4}{1 + i % 12:02}01"} for i in range(150)],
        "network": [{"LocalName": f"{chr(85 + i)}:", "RemoteName": f"\\\\server\\share{i}", "Status": "OK"} for i in range(5)],
        "registry": {"HKEY_LOCAL_MACHINE\\Software\\Quorvex": registry_key(rng, 3)},
        "product_information": {
            "install_location": product,
            "file_information": [{"path": f"{product}\\{i // 50}\\{i}_{MODULES[i % len(MODULES)]}", "md5": md5(rng),
                                  "version": "7.2.1.0" if i % 40 else "7.2.0.9"} for i in range(500)],
            "last_update": {"Engine": {"check": {"time": str(COLLECTED_AT - 900_000)},
                                       "update": {"time": str(COLLECTED_AT - 1_000_000)}}}},
        "guiData": {"user_details": {"name": "Anna Example", "email": "anna@example.com"},
                    "issue": {"name": "slow", "description": "Everything is slow since the update.\nAlso </script> \u202e.",
                              "can_be_reproduced": True, "reproduce_start_time": COLLECTED_AT - 1800,
                              "reproduce_stop_time": COLLECTED_AT - 600}}}
    collectors = [{"name": name, "class": "", "outcome": "data", "records": len(document), "bytes": 0, "milliseconds": 5,
                   "errors": []} for name, document in written.items() if name != "guiData"]
    collectors.append({"name": "printers", "class": "PrintersCollector", "outcome": "no data", "reason": "Query failed",
                       "records": 0, "bytes": 0, "milliseconds": 5, "errors": ["WMIWrapper: Query failed with 0x80041013"]})
    written["collection_manifest"] = {"tool_version": "1.0.0", "start": "2024-03-04T12:00:00Z", "end": "2024-03-04T12:00:40Z",
                                      "utc_offset_minutes": UTC_OFFSET // 60, "collectors": collectors}
    return written


def make_package(file, events=50_000, process_count=400):
    """Made anew unless it is there. Returns its name."""
    if not os.path.exists(file):
        with zipfile.ZipFile(f"{file}.partial", "w", zipfile.ZIP_DEFLATED) as archive:
            for name, document in documents(events, process_count).items():
                archive.writestr(f"collected/{name}.json", json.dumps(document, indent=3))
            archive.writestr("Logs/engine.log", LANGUAGE.message(random.Random(7)) + "\n")
        os.rename(f"{file}.partial", file)
    return file


if __name__ == "__main__":
    if not 2 <= len(sys.argv) <= 4:
        sys.exit(__doc__)
    make_package(sys.argv[1], *map(int, sys.argv[2:]))
