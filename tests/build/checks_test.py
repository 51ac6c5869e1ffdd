#!/usr/bin/env python3
"""Shows that the checks of this folder find the faults that they are for."""

import pathlib
import tempfile
import unittest

import check_layering
import check_module


def faults_in(files):
    """Faults of a tree that consists of the given files."""
    with tempfile.TemporaryDirectory() as folder:
        for name, text in files.items():
            path = pathlib.Path(folder, name)
            path.parent.mkdir(parents=True, exist_ok=True)
            path.write_text(text, encoding="utf-8")
        return check_layering.check_tree(pathlib.Path(folder))


class LayeringTest(unittest.TestCase):
    def test_downward_includes_pass(self):
        self.assertEqual(faults_in({
            "engine/foundation/a.h": "#include <vector>\n",
            "engine/bitmap/b.h": '#include "engine/foundation/a.h"\n',
            "engine/codecs/c.h": '#include "engine/bitmap/b.h"\n',
            "engine/io/zalmoio.cpp": '#include "engine/codecs/c.h"\n',
            "host/h.cpp": '#include "plugin/p.h"\n',
            "plugin/p.h": '#include "engine/codecs/c.h"\n',
        }), [])

    def test_each_fault_is_found(self):
        low = "engine/foundation/low.h"
        cases = {
            "lies higher": ("engine/bitmap/b.h", '#include "engine/codecs/c.h"\n'),
            "no path from the root": ("engine/bitmap/b.h", '#include "low.h"\n'),
            "of another program": ("tests/t.cpp", '#include "bench/x.h"\n'),
            "tests _WIN32": ("plugin/p.cpp", "#if defined(_WIN32)\n"),
            "includes <unistd.h>": ("host/h.cpp", "#include <unistd.h>\n"),
            "circle": (low, '#include "engine/foundation/other.h"\n'),
        }
        for wanted, (name, text) in cases.items():
            files = {low: "", "engine/codecs/c.h": "", "bench/x.h": "",
                     "engine/foundation/other.h": f'#include "{low}"\n'}
            faults = faults_in({**files, name: text})
            self.assertEqual(len(faults), 1, faults)
            self.assertIn(wanted, faults[0])

    def test_platform_may_know_its_system(self):
        self.assertEqual(faults_in({
            "engine/platform/linux/files.cpp": "#include <unistd.h>\n#ifdef __linux__\n#endif\n",
        }), [])

    def test_empty_tree_is_a_fault(self):
        self.assertEqual(len(faults_in({"readme": ""})), 1)


OBJDUMP = """
Graphics.qvp:     file format pei-i386

\tDLL Name: KERNEL32.dll
\tDLL Name: {library}

[Ordinal/Name Pointer] Table
\t[   0] InitQVPlugin
{more}
The Base Relocations
\t[   1] NotAnExport
"""


class ModuleTest(unittest.TestCase):
    def faults(self, library="msvcrt.dll", more="", machine="pei-i386"):
        text = OBJDUMP.format(library=library, more=more).replace("pei-i386", machine)
        return list(check_module.windows_faults(text, is_module=True))

    def test_right_module_passes(self):
        self.assertEqual(self.faults(), [])

    def test_wrong_modules_fail(self):
        self.assertIn("libstdc++-6.dll", self.faults(library="libstdc++-6.dll")[0])
        self.assertIn("InitQVPlugin@4", self.faults(more="\t[   1] InitQVPlugin@4\n")[0])
        self.assertIn("32-bit", self.faults(machine="pei-x86-64")[0])

    def test_linux_names(self):
        text = "00001130 T InitQVPlugin\n00001140 W _ZSt4endl@@V1\n"
        self.assertEqual(check_module.linux_exports(text), ["InitQVPlugin", "_ZSt4endl"])
        self.assertTrue(list(check_module.export_faults(["InitQVPlugin", "x"])))
        self.assertTrue(list(check_module.export_faults([])))


if __name__ == "__main__":
    unittest.main()
