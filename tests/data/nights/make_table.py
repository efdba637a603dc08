#!/usr/bin/env python3
"""Writes expected.tsv: the seconds asleep in each noon-to-noon day, named by the day in which it ends.

    python3 make_table.py input.zip Europe/London > expected.tsv

For records of one source. Needs nothing of the program.
"""
import datetime
import re
import sys
import zipfile
from zoneinfo import ZoneInfo

UTC = datetime.timezone.utc


def records(path):
    with zipfile.ZipFile(path) as archive:
        name = next(name for name in archive.namelist() if name.endswith(".xml"))
        for line in archive.open(name):
            if b"<Record" not in line or b"SleepAnalysis" not in line:
                continue
            attributes = dict(re.findall(r'(\w+)="([^"]*)"', line.decode()))
            start, end = (
                datetime.datetime.strptime(attributes[key], "%Y-%m-%d %H:%M:%S %z").astimezone(UTC)
                for key in ("startDate", "endDate")
            )
            yield start, end, attributes["value"].endswith("Asleep")


def main(path, zone_name):
    zone = ZoneInfo(zone_name)
    joined = []
    for start, end in sorted((s, e) for s, e, asleep in records(path) if asleep):
        if joined and start <= joined[-1][1]:
            joined[-1][1] = max(joined[-1][1], end)
        else:
            joined.append([start, end])

    def noon(day):
        return datetime.datetime(day.year, day.month, day.day, 12, tzinfo=zone).astimezone(UTC)

    totals = {}
    for start, end in joined:
        day = start.astimezone(zone).date()
        while start < end:
            if start < noon(day):
                part = min(end, noon(day))
                totals[day] = totals.get(day, 0) + (part - start).total_seconds()
                start = part
            day += datetime.timedelta(days=1)
    for day in sorted(totals):
        print(day, int(totals[day]), sep="\t")


main(*sys.argv[1:])
