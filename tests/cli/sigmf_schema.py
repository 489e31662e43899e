#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Exports waveforms as SigMF recordings and checks these by the rules of the standard (1.2): the
metadata by its JSON schema, as far as it concerns a recording, the data by size and checksum; then
takes them back.

sigmf_schema.py CORVANE-CLI"""

import hashlib
import json
import subprocess
import sys
import tempfile
from pathlib import Path

try:
    import jsonschema
except ImportError:
    print("python3-jsonschema is not installed")
    sys.exit(77)

COUNT = {"type": "integer", "minimum": 0}
TEXT = {"type": "string"}
SCHEMA = {
    "type": "object",
    "required": ["global", "captures", "annotations"],
    "additionalProperties": False,
    "properties": {
        "global": {
            "type": "object",
            "required": ["core:datatype", "core:version"],
            "properties": {
                "core:datatype": {"pattern": "^(c|r)(f32|f64|i32|i16|u32|u16|i8|u8)(_le|_be)?$"},
                "core:version": {"pattern": "^\\d+\\.\\d+\\.\\d+$"},
                "core:sample_rate": {"type": "number", "exclusiveMinimum": 0, "maximum": 1e12},
                "core:num_channels": {"type": "integer", "minimum": 1},
                "core:sha512": {"pattern": "^[0-9a-fA-F]{128}$"},
                "core:description": TEXT,
                "core:recorder": TEXT,
                "core:extensions": {
                    "type": "array",
                    "items": {
                        "type": "object",
                        "required": ["name", "version", "optional"],
                        "additionalProperties": False,
                        "properties": {
                            "name": TEXT,
                            "version": TEXT,
                            "optional": {"type": "boolean"},
                        },
                    },
                },
            },
        },
        "captures": {
            "type": "array",
            "items": {
                "type": "object",
                "required": ["core:sample_start"],
                "properties": {
                    "core:sample_start": COUNT,
                    "core:datetime": {
                        "pattern": "^\\d{4}-\\d\\d-\\d\\dT\\d\\d:\\d\\d:\\d\\d(\\.\\d+)?Z$"
                    },
                },
            },
        },
        "annotations": {
            "type": "array",
            "items": {
                "type": "object",
                "required": ["core:sample_start"],
                "properties": {
                    "core:sample_start": COUNT,
                    "core:sample_count": COUNT,
                    "core:label": {"type": "string", "maxLength": 20},
                },
            },
        },
    },
}
# Names without the namespace "core" must be those of a declared extension.
SAMPLE_BYTES = {"ci16_le": 4, "cf32_le": 8}


def check(meta: Path, samples: int) -> None:
    """Fails where the recording breaks a rule."""
    recording = json.loads(meta.read_text(encoding="utf-8"))
    jsonschema.validate(recording, SCHEMA)
    info = recording["global"]
    data = meta.with_suffix(".sigmf-data").read_bytes()
    assert len(data) == samples * SAMPLE_BYTES[info["core:datatype"]], len(data)
    assert info["core:sha512"] == hashlib.sha512(data).hexdigest()
    declared = {"core"} | {each["name"] for each in info.get("core:extensions", [])}
    for part in [info, *recording["captures"], *recording["annotations"]]:
        for key in part:
            assert key.split(":")[0] in declared and ":" in key, key
    for kind in ("captures", "annotations"):
        starts = [each["core:sample_start"] for each in recording[kind]]
        assert starts == sorted(starts), f"{kind} are not in order"
    for mark in recording["annotations"]:
        assert mark["core:sample_start"] + mark["core:sample_count"] <= samples, mark


def main() -> None:
    cli = sys.argv[1]
    with tempfile.TemporaryDirectory() as folder:

        def run(*arguments: str) -> None:
            subprocess.run([cli, "--quiet", *arguments], cwd=folder, check=True)

        run("create", "noise", "--bandwidth", "40k", "--duration", "100ms", "--seed", "7",
            "--min-clock", "1k", "--comment", "a \"quoted\" one", "-o", "plain.wv")  # fmt: skip
        run("markers", "plain.wv", "-o", "in.wv", "--marker", "1", "--from", "1", "--to", "100",
            "--action", "high", "--marker", "3", "--from", "50", "--to", "6000",
            "--action", "pattern", "--pattern", "0110")  # fmt: skip
        run("dump", "in.wv", "-o", "in.csv")
        for kind in ("s16", "f32"):
            run("export", "in.wv", "-o", f"{kind}.sigmf-meta", "--type", kind)
            check(Path(folder) / f"{kind}.sigmf-meta", 6000)
            run("import", "sigmf", f"{kind}.sigmf-meta", "-o", f"{kind}.wv", "--scaling", "none")
            run("dump", f"{kind}.wv", "-o", f"{kind}.csv")
            back = (Path(folder) / f"{kind}.csv").read_bytes()
            assert back == (Path(folder) / "in.csv").read_bytes(), f"{kind} came back changed"


if __name__ == "__main__":
    main()
