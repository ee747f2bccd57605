#!/usr/bin/env python3
"""Counts the results in a JUnit file, as ctest and pytest write it.

    junit_counts.py RESULTS.xml SKIPS

prints "passed failed skipped" and writes one line per skipped test into SKIPS: its name and the
reason that the test gave. A file that is absent, broken or without a single test gives status 1:
a run of nothing is never a success.
"""
import re
import sys
import xml.etree.ElementTree as ElementTree


def skip_reason(case, skipped):
    """pytest puts the reason into the message; GoogleTest prints it below a line "... Skipped"."""
    printed = re.search(r"Skipped\n+(.*)", case.findtext("system-out") or "")
    if printed:
        return printed.group(1).strip()
    return (skipped.get("message") or "").strip() or "no reason given"


def main():
    results, skips = sys.argv[1:]
    try:
        cases = list(ElementTree.parse(results).getroot().iter("testcase"))
    except (OSError, ElementTree.ParseError) as trouble:
        print(f"junit_counts.py: {results}: {trouble}", file=sys.stderr)
        return 1
    passed = failed = 0
    reasons = []
    for case in cases:
        skipped = case.find("skipped")
        if case.find("failure") is not None or case.find("error") is not None:
            failed += 1
        elif skipped is not None:
            reasons.append(f"{case.get('name')}: {skip_reason(case, skipped)}")
        elif case.get("status", "run") == "run":
            passed += 1
        else:
            failed += 1  # ctest: "fail", "disabled", a program that is not there
    with open(skips, "w", encoding="utf-8") as out:
        out.writelines(line + "\n" for line in reasons)
    print(passed, failed, len(reasons))
    return 0 if cases else 1


if __name__ == "__main__":
    sys.exit(main())
