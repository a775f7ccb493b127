"""Shows each of the house's checks a tree that breaks one rule, and expects it to say so.

Usage: checks_test.py <folder of the checks>
"""

import pathlib
import shutil
import subprocess
import sys
import tempfile
import unittest

TOOLS = pathlib.Path(sys.argv.pop(1))

# A tree in order, with a file in every room.
ORDERLY = {
    "basic/core/export.h": "",
    "basic/exceptions/exceptions.h": '#include "basic/core/export.h"\n',
    "basic/core/interpretationtypes.h": "",
    "basic/tessel/raster.h": '#include "basic/core/export.h"\n',
    "basic/tessel/clipto.h": "",
    "basic/core/typedispatch/typedispatch.h": '#include "basic/tessel/raster.h"\n',
    "processes/gridmill/iprocessor.h": '#include "basic/tessel/raster.h"\n',
    "processes/gridmill/frame/processorcache.h": "",
    "processes/gridmill/frame/frame.h": '#include "basic/core/typedispatch/typedispatch.h"\n',
    "processes/gridmill/frame/rows.h": "#pragma omp parallel for\n",
    "processes/gridmill/kernels/multiversion.h": '__attribute__((target_clones("default")))\n',
    "processes/gridmill/kernels/kernel.h": '#include "basic/tessel/clipto.h"\n',
    "processes/gridmill/one.h": '#include "processes/gridmill/frame/processorcache.h"\n'
    '#include "processes/gridmill/iprocessor.h"\n',
    "processes/gridmill/one.cpp": '#include "processes/gridmill/one.h"\n\n'
    '#include "processes/gridmill/frame/frame.h"\n#include "processes/gridmill/kernels/kernel.h"\n',
    "processes/gridmill/two.h": "",
    "processes/gridmill/gridmill.h": '#include "processes/gridmill/one.h"\n#include "processes/gridmill/two.h"\n',
}


def include(path):
    return f'#include "{path}"\n'


class Tree(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.root = pathlib.Path(folder.name)
        for path, text in ORDERLY.items():
            self.write(path, text)

    def write(self, path, text):
        (self.root / path).parent.mkdir(parents=True, exist_ok=True)
        (self.root / path).write_text(text, encoding="utf-8")

    def append(self, path, text):
        self.write(path, (self.root / path).read_text(encoding="utf-8") + text)

    def check(self, tool, *arguments):
        run = subprocess.run(
            [sys.executable, TOOLS / tool, *arguments], capture_output=True, text=True, check=False
        )
        self.assertEqual(run.stderr, "")
        return run.returncode, run.stdout

    def expect_failure(self, tool, message):
        code, output = self.check(tool, self.root)
        self.assertIn(message, output)
        self.assertEqual(code, 1)


class Includes(Tree):
    def expect_wrong_way(self, path, target):
        self.append(path, include(target))
        self.expect_failure("check_includes", f"includes {target} (")

    def test_a_tree_in_order_passes(self):
        self.assertEqual(self.check("check_includes", self.root)[0], 0)

    def test_exceptions_see_no_raster(self):
        self.expect_wrong_way("basic/exceptions/exceptions.h", "basic/tessel/raster.h")

    def test_core_sees_no_raster(self):
        self.expect_wrong_way("basic/core/interpretationtypes.h", "basic/tessel/raster.h")

    def test_rasters_see_no_dispatcher(self):
        self.expect_wrong_way("basic/tessel/clipto.h", "basic/core/typedispatch/typedispatch.h")

    def test_basic_sees_no_process(self):
        self.expect_wrong_way("basic/tessel/raster.h", "processes/gridmill/iprocessor.h")

    def test_the_frame_sees_no_kernel(self):
        self.expect_wrong_way("processes/gridmill/frame/frame.h", "processes/gridmill/kernels/kernel.h")

    def test_a_kernel_sees_no_frame(self):
        self.expect_wrong_way("processes/gridmill/kernels/kernel.h", "processes/gridmill/frame/frame.h")

    def test_no_operator_sees_another(self):
        self.expect_wrong_way("processes/gridmill/one.cpp", "processes/gridmill/two.h")

    def test_an_operators_header_sees_no_dispatcher(self):
        self.expect_wrong_way("processes/gridmill/one.h", "processes/gridmill/frame/frame.h")

    def test_nothing_sees_all_operators(self):
        self.expect_wrong_way("processes/gridmill/one.cpp", "processes/gridmill/gridmill.h")

    def test_a_kernel_sees_no_raster_by_way_of_another_header(self):
        self.append("basic/tessel/clipto.h", include("basic/tessel/raster.h"))
        self.expect_failure("check_includes", "kernel.h: a kernel sees basic/tessel/raster.h")

    def test_no_header_includes_itself(self):
        self.append("processes/gridmill/one.h", include("processes/gridmill/one.h"))
        self.expect_failure("check_includes", "processes/gridmill/one.h includes itself")

    def test_include_lines_start_at_the_top(self):
        self.append("processes/gridmill/one.cpp", include("two.h"))
        self.expect_failure("check_includes", 'no file "two.h"')

    def test_the_header_of_all_operators_has_all(self):
        self.write("processes/gridmill/three.h", "")
        self.expect_failure("check_includes", "gridmill.h does not include processes/gridmill/three.h")

    def test_every_file_has_a_room(self):
        self.write("basic/other.h", "")
        self.append("processes/gridmill/one.cpp", include("basic/other.h"))
        self.expect_failure("check_includes", "basic/other.h: lies in no room")


class House(Tree):
    def expect_in(self, path, text, message):
        self.write(path, text)
        self.expect_failure("check_house", f"{path}{message}")

    def test_a_tree_in_order_passes(self):
        code, output = self.check("check_house", self.root)
        self.assertEqual((code, output.splitlines()[-1]), (0, "the house is in order"))

    def test_lines_have_110_columns(self):
        self.expect_in("tests/a.cpp", "//" + "x" * 109 + "\n", ":1: 111 columns")

    def test_tabs(self):
        self.expect_in("cmake/a.cmake", "\n\tset(a b)\n", ":2: a tab")

    def test_fast_math(self):
        self.expect_in("CMakeLists.txt", "add_compile_options(-ffast-math)\n", ":1: arithmetic")

    def test_things_left_to_do(self):
        self.expect_in("examples/a.cpp", "// TODO\n", ":1: something left to do")

    def test_multiversioning_outside_its_header(self):
        self.expect_in("processes/gridmill/one.cpp", '__attribute__((target_clones("default")))\n', ":1: multi")

    def test_parallel_constructs_outside_the_frame(self):
        self.expect_in("processes/gridmill/one.cpp", "#pragma omp simd\n", ":1: a parallel construct")

    def test_casts_to_an_integer_and_back(self):
        line = "float x = tessel::PlainCast<float>(tessel::PlainCast<int>(y));\n"
        self.expect_in("processes/gridmill/one.cpp", line, ":1: a cast to an integer and back")

    def test_function_like_macros(self):
        self.expect_in("processes/gridmill/one.h", "#define ONE(x) x\n", ":1: a function-like macro")

    def test_long_headers(self):
        self.expect_in("basic/tessel/raster.h", "//\n" * 301, ": 301 lines, a header")

    def test_long_operators(self):
        self.expect_in("processes/gridmill/one.cpp", "//\n" * 251, ": 251 lines, an operator")

    @unittest.skipUnless(shutil.which("clang-format-14"), "clang-format-14 is missing")
    def test_the_format(self):
        self.write(".clang-format", "BasedOnStyle: Google\n")
        self.expect_in("basic/tessel/clipto.h", "int  a ;\n", ": not as clang-format writes it")


class Symbols(Tree):
    def setUp(self):
        super().setUp()
        compiler = shutil.which("c++") or shutil.which("g++") or shutil.which("clang++")
        if compiler is None:
            self.skipTest("no compiler on the path")
        self.write("a.cpp", "#include <string>\nnamespace orvik {\nauto Length(int n) { return std::string(n, ' ').size(); }\n}\n")
        self.library = self.root / "liba.so"
        self.list = self.root / "list.txt"
        subprocess.run(
            [compiler, "-shared", "-fPIC", "-o", self.library, self.root / "a.cpp"], check=True
        )

    def compare(self):
        return self.check("check_symbols", self.library, self.list)

    def test_the_listed_symbols_pass(self):
        self.check("check_symbols", "--update", self.library, self.list)
        self.assertEqual(self.list.read_text(encoding="utf-8"), "orvik::Length(int)\n")
        self.assertEqual(self.compare()[0], 0)

    def test_a_symbol_that_is_not_listed(self):
        self.list.write_text("", encoding="utf-8")
        code, output = self.compare()
        self.assertEqual(code, 1)
        self.assertIn("not in the list: orvik::Length(int)", output)

    def test_a_symbol_that_is_gone(self):
        self.check("check_symbols", "--update", self.library, self.list)
        with self.list.open("a", encoding="utf-8") as file:
            file.write("orvik::Gone()\n")
        self.assertEqual(self.compare(), (1, "missing: orvik::Gone()\n"))


if __name__ == "__main__":
    unittest.main()
