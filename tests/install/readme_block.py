#!/usr/bin/env python3
"""Prints the first ```LANG block under the README heading SECTION: the README's snippets are tests.
    readme_block.py README.md "Use from CMake" cmake
"""
import re
import sys

readme, section, lang = sys.argv[1:4]
text = open(readme).read()
part = re.search(rf"^## {re.escape(section)}\n(.*?)(?=^## |\Z)", text, re.S | re.M)
block = part and re.search(rf"^```{lang}\n(.*?)^```", part.group(1), re.S | re.M)
if not block:
    sys.exit(f"README: no {lang} block under '## {section}'")
sys.stdout.write(block.group(1))
