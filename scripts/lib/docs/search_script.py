#!/usr/bin/python3
"""Writes the index of the search as a script, too, for pages that are opened as files: search_script.py SITE"""
import sys
from pathlib import Path

index = Path(sys.argv[1]) / "search/search_index.json"
script = f"var __index = {index.read_text()};\nvar __search = {{ index: Promise.resolve(__index) }};\n"
index.with_suffix(".js").write_text(script)
