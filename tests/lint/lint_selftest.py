# SPDX-License-Identifier: Apache-2.0
"""Builds small source trees, each with one fault, and checks that lint.py finds it and no other."""
import tempfile
import unittest
from pathlib import Path

from lint import lint

TABLE = "# order\nprotocols plain\nvisa plain\nsimulator plain\nsrc/base core\nsrc/jobs core\nsrc/app window\nsrc/jobs/ui window\n"
SOUND = {
    "src/base/Clock.h": "#include <QObject>\n#include <vector>\n",
    "src/jobs/Job.cpp": '#include "Job.h"\n#include "base/Clock.h"\n#include "visa/visa.h"\n',
    "src/jobs/Job.h": "",
    "src/jobs/ui/Dialog.cpp": '#include "app/Window.h"\n#include "jobs/Job.h"\n#include "ui_Dialog.h"\n',
    "src/app/Window.h": "#include <QWidget>\n#include <QtWidgets/QDialog>\n",
    "visa/visa.h": "#include <cstdint>\n",
    "visa/Link.h": '#include "vxi11.h"\n',
    "tests/base/tst.cpp": "QTRY_VERIFY(done); // no qWait(10) needed\nQTest::qWaitFor(ready);\n",
}
# File, its text, and what the report says of it.
FAULTS = [
    ("src/base/Up.h", '#include "jobs/Job.h"\n', "upward"),
    ("src/base/Up.cpp", '#include "../jobs/Job.h"\n', "upward"),
    ("src/jobs/Job.h", '#include "ui/Dialog.cpp"\n', "upward"),
    ("src/app/Window.h", '#  include "jobs/ui/Dialog.cpp"\n', "upward"),
    ("src/base/Gui.h", "#include <QWidget>\n", "without windows"),
    ("src/base/Gui.h", "#include <QtWidgets/QDialog>\n", "without windows"),
    ("src/base/Gui.h", "#include <QtWidgets>\n", "without windows"),
    ("visa/Qt.h", "#include <QString>\n", "without Qt"),
    ("simulator/Peer.h", '#include "visa/Link.h"\n', "know nothing"),
    ("src/base/Peer.h", '#include "visa/Link.h"\n', "know nothing"),
    ("src/other/New.h", '#include "base/Clock.h"\n', "no folder"),
    ("src/base/Gone.h", '#include "base/Gone2.h"\n', "not there"),
    ("tests/base/tst2.cpp", "    QTest::qWait(20);\n", "sleeps"),
    ("tests/base/tst2.cpp", "std::this_thread::sleep_for(1ms);\n", "sleeps"),
    ("tests/base/tst2.h", "QThread::msleep(1); ::usleep(5);\n", "sleeps"),
    ("tests/base/tst2.h", "sleep(1);\n", "sleeps"),
]


class LintTest(unittest.TestCase):
    def run_lint(self, files):
        with tempfile.TemporaryDirectory() as name:
            qt = Path(name) / "QtWidgets"
            for path in (qt / "QWidget", qt / "QDialog"):
                path.parent.mkdir(exist_ok=True)
                path.write_text("")
            root = Path(name) / "root"
            for path, text in {"cmake/folders.txt": TABLE, **files}.items():
                (root / path).parent.mkdir(parents=True, exist_ok=True)
                (root / path).write_text(text)
            return lint(root, [str(qt)])[0]

    def test_sound_tree(self):
        self.assertEqual(self.run_lint(SOUND), [])

    def test_faults(self):
        for path, text, words in FAULTS:
            with self.subTest(path=path, text=text):
                found = self.run_lint({**SOUND, path: text})
                self.assertEqual(len(found), 1, found)
                self.assertTrue(found[0].startswith(path + ":1:"), found)
                self.assertIn(words, found[0])


if __name__ == "__main__":
    unittest.main()
