"""The reference page as its readers use it, in a headless Chromium.

Run as: page_test.py PAGE.
"""

import os
import pathlib
import sys
import time
import unittest

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
sys.path[:0] = [os.path.join(ROOT, "tools"), os.path.join(ROOT, "tools", "reference")]
import generate_headers  # noqa: E402
import not_built  # noqa: E402
from browser import START, Browser  # noqa: E402

PAGE = pathlib.Path(sys.argv.pop(1)).resolve().as_uri()
FAMILIES = generate_headers.all_rows()
ROWS = [row for _, _, rows in FAMILIES.values() for row in rows]

DESKTOP, PHONE = (1280, 860), (390, 844)


def short(row):
    return generate_headers.short_name(row.name).removeprefix("ZRA_")


class Page(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.browser = Browser()
        cls.addClassCleanup(cls.browser.close)

    def setUp(self):
        self.browser.resize(*DESKTOP)

    def tearDown(self):
        self.assertEqual(self.browser.errors(), [])

    def open(self, part=""):
        self.browser.open(PAGE + part)

    def run_script(self, script, *arguments):
        return self.browser.run(script, *arguments)

    def type(self, text):
        self.run_script("document.getElementById('query').select()")
        self.browser.press(text)

    def names(self):
        """All names found: the list grows while it is scrolled."""
        return self.run_script("""
            const list = document.getElementById('results');
            for (let shown = -1; shown !== list.childElementCount;) { shown = list.childElementCount; showMore(); }
            return [...list.querySelectorAll('.name')].map((name) => name.textContent);""")

    def first_names(self, count):
        return self.run_script("return [...document.querySelectorAll('#results .name')].map((n) => n.textContent)")[:count]

    def title(self):
        return self.run_script("return document.querySelector('#entry h2').textContent")

    def entry(self):
        return self.run_script("return document.getElementById('entry').innerText")

    def message(self):
        return self.run_script("return document.getElementById('message').textContent")

    def focused(self):
        return self.run_script("return document.activeElement.id || document.activeElement.innerText.split('\\n')[0]")

    def hash(self):
        return self.run_script("return location.hash")

    def until(self, expected, ask):
        """Waits for what the browser does in its own time."""
        end = time.monotonic() + START
        while ask() != expected and time.monotonic() < end:
            time.sleep(0.05)
        self.assertEqual(ask(), expected)

    def test_every_row_has_an_entry(self):
        self.open()
        self.assertEqual(self.names(), [short(row) for row in ROWS])
        shown = self.run_script("""
            return entries.map((entry) => { show(entry); const main = document.getElementById('entry');
              const text = main.textContent;
              return [entry.symbol, text.includes(entry.symbol), /null|undefined/.test(text),
                main.querySelectorAll('.lanes .out, .lanes .in').length]; });""")
        self.assertEqual([name for name, *_ in shown], [generate_headers.symbol(row.name) for row in ROWS])
        self.assertEqual([name for name, named, null, _ in shown if null or not named], [])
        self.assertEqual(len([name for name, _, _, lines in shown if lines == 0]), 3, "two NOPs and SCATTERW show nothing")

    def test_search_by_name_type_and_text(self):
        self.open()
        self.type("addsnx16")
        self.assertEqual(self.first_names(2), ["ADDSNX16", "ADDSNX16T"])
        self.assertEqual(self.hash(), "#q=addsnx16")
        self.type("cstub_Km_ZNB_Orbis_R5_64k__KOR_rk_zra32_ZRA_MULNX16C")
        self.assertEqual(self.names(), ["MULNX16C"])
        self.type("valign")
        self.assertEqual(set(self.names()), {short(row) for row in ROWS if "valign" in row.prototype})
        self.type("qqqq")
        self.assertEqual(self.names(), [])
        self.assertIn("No intrinsic matches", self.message())
        self.type("conjugated modulo")
        conjugating = {short(row) for row in ROWS if "conjugated" in row.doc}
        self.assertEqual(set(self.first_names(len(conjugating))), conjugating)

    def test_plain_forms_go_before_their_variants(self):
        self.open()
        for query, order in {"add 16 bit": ["ADDNX16", "ADDNX16U", "ADDNX16T"], "mulanx16": ["MULANX16", "MULANX16PACKL"],
                             "shift left": ["SLLNX16", "SLLINX16"], "load 16 bit": ["LVNX16_I", "LVNX16_IP", "LVNX16T_I"]}.items():
            self.type(query)
            names = self.names()
            self.assertEqual(sorted(order, key=names.index), order, query)

    def test_search_by_regular_expression(self):
        self.open()
        self.run_script("document.getElementById('regex').click()")
        self.type("^ADDS?NX16U?$")
        self.assertEqual(self.names(), ["ADDNX16", "ADDNX16U", "ADDSNX16"])
        self.type("(")
        self.assertIn("not a regular expression", self.message())
        self.assertEqual(self.run_script("return document.getElementById('query').ariaInvalid"), "true")
        self.type("^PACKP")
        self.assertEqual((self.names(), self.message()), (["PACKPNX48"], "1 intrinsic"))

    def test_filters(self):
        self.open("#family=float&with=predicated")
        self.assertEqual(self.names(), [short(row) for row in FAMILIES["float"][2] if "_T" in row.shape])
        self.run_script("""
            const lane = document.getElementById('lane');
            lane.value = '16'; lane.dispatchEvent(new Event('change', {bubbles: true}));""")
        halves = [name for name in self.names() if "F16" in name]
        self.assertEqual(self.names(), halves)
        self.assertEqual(self.hash(), "#family=float&lane=16&with=predicated")
        self.browser.press("Escape")
        self.assertEqual(len(self.names()), len(ROWS))

    def test_links_open_entries(self):
        symbol = generate_headers.symbol("rk_zra32_ZRA_ADDNX16")
        for part in ("#ADDNX16", "#ZRA_ADDNX16", "#addnx16", "#zra_AddNx16", "#" + symbol):
            self.open(part)
            self.assertEqual(self.title(), "ADDNX16")
        self.open("#ADDNX16&q=adds")
        self.assertEqual((self.title(), self.first_names(1)), ("ADDNX16", ["ADDSNX16"]))
        self.open("#NOSUCH")
        self.assertIn("no intrinsic named NOSUCH", self.entry())
        self.open("#addsnx61")
        self.assertIn("Near it: ADDSNX16", self.entry())

    def test_what_is_not_built_says_what_to_write_instead(self):
        for part, topic in (("#selnx16", "select"), ("#ZRA_RADDANX16", "sums"), ("#q=shuffle", "select"), ("#q=SQZN", "compress")):
            self.open(part)
            if "q=" in part:
                self.run_script("document.querySelector('#results a').click()")
                self.until(True, lambda: self.title().startswith("Not built"))
            expected = next(t for t in not_built.TOPICS if t.key == topic)
            self.assertEqual(self.title(), "Not built: " + expected.title.replace("`", ""))
            self.assertIn(expected.why.lower(), self.entry().lower())
            self.assertIn(expected.instead.replace("`", ""), self.entry())
        self.open("#SELS2NX8")
        self.assertEqual(self.title(), "SELS2NX8", "what is there is not said to be missing")

    def test_an_entry_says_what_its_row_says(self):
        self.open("#LSNX16_IP")
        for text in ("Cycles a call costs, operands in memory, measured on: ", "kastarri/names/memory.h",
                     "void ZRA_LSNX16_IP(qv_int16& r, const short** pointer, int increment);", "1 x 16 bits, signed",
                     "The address of the destination r is tested", "Post-increment element loads test the address",
                     "src/memory/elements.def", "a choice of this library"):
            self.assertIn(text, self.entry())
        self.open("#LVNX16_IP")
        self.assertIn("loads the 64 bytes at the address. The address is the pointer, which then moves by increment bytes.", self.entry())
        self.open("#ADDSNX16T")
        self.assertIn("Where predicate bit i is 0, r keeps lane i", self.entry())
        rows = self.run_script("return [...document.querySelectorAll('.lanes tr')].map((row) => row.innerText.split(/\\s+/))")
        self.assertEqual(rows[1][:4], ["r", "10", "-20", "30"])
        self.assertEqual(rows[5][:5], ["r", "after", "3", "-20", "293"])
        self.open("#MULQAN16XR8")
        self.assertIn("s3 = 4, s2 = 3, s1 = -1, s0 = -2 (0x0403fffe)", self.entry().replace("\N{NO-BREAK SPACE}", " "))
        self.assertRegex(self.entry(), "acc\tqv_vecNx48\\s.*accumulator.*\\s.*read and written")
        self.open("#MULUUPN16XR16")
        self.assertIn("s1 = 1027, s0 = 65534", self.entry().replace("\N{NO-BREAK SPACE}", " "))

    def test_calls_to_copy(self):
        for name, call in {"ADDNX16": "const qv_vecNx16 result = ZRA_ADDNX16(a, b);", "MULANX16": "ZRA_MULANX16(acc, a, b);",
                           "LVNX16_IP": "qv_vecNx16 r;\nZRA_LVNX16_IP(r, &pointer, increment);", "RK_NOP": "RK_NOP();"}.items():
            self.open("#" + name)
            self.assertEqual(self.run_script("return document.querySelector('.call pre').textContent"), call)

    def test_twins(self):
        self.open("#LVNX16_I")
        twins = self.run_script("return Object.fromEntries(AXES.map((t, i) => [t, twinsOf(entryNamed('LVNX16_I'), i).map((e) => e.id)]))")
        self.assertEqual(twins["With and without a predicate"], ["LVNX16T_I"])
        self.assertEqual(twins["Other addressing"], ["LVNX16_X", "LVNX16_IP", "LVNX16_XP"])
        self.assertEqual(twins["Other signs"], ["LVNX16U_I"])
        self.assertEqual(set(twins["Other lanes"]), {"LV2NX8_I", "LVN_2X32_I", "LVN_4X64_I", "LVNXF16_I", "LVN_2XF32_I", "LVN_2XF16_I"})
        self.run_script("[...document.querySelectorAll('.twins a')].find((a) => a.textContent === 'LVNX16_IP').click()")
        self.until("LVNX16_IP", self.title)
        found = self.run_script("""return ['MULANX16', 'ADDSNX16', 'LTUNX16', 'PACKVRNX48_0', 'scalarfp_ADD_H'].map((name) =>
            AXES.flatMap((t, i) => twinsOf(entryNamed(name), i).map((e) => e.id)));""")
        for name, several in zip(("MULNX16", "ADDNX16", "LTNX16", "PACKVR2NX24_0", "scalarfp_ADD_S"), found):
            self.assertIn(name, several)

    def test_the_start_page_explains_names_and_types(self):
        self.open()
        for text in ("N is 32", "_IP _XP", "NX48", "RoundMode", "qv_vecN_2x64w"):
            self.assertIn(text, self.entry())
        links = self.run_script("return [...document.querySelectorAll('.queries a')].map((a) => a.textContent)")
        for query in links:
            self.open("#q=" + query)
            self.assertGreater(self.run_script("return found.length"), 0, query)

    def test_keyboard(self):
        self.open()
        self.browser.press("/")
        self.assertEqual(self.focused(), "query")
        self.browser.press("addnx16")
        self.browser.press("ArrowDown")
        self.assertEqual(self.focused(), "ADDNX16")
        self.browser.press("j")
        self.assertEqual(self.focused(), "ADDNX16U")
        self.browser.press("j", "k", "Enter")
        self.until("ADDNX16U", self.title)
        self.assertEqual(self.hash(), "#ADDNX16U&q=addnx16")
        self.browser.press("ArrowUp", "ArrowUp")
        self.assertEqual(self.focused(), "query")
        self.browser.press("Escape")
        self.assertEqual((self.hash(), self.focused(), len(self.names())), ("#ADDNX16U", "query", len(ROWS)))
        self.browser.press("mulnx16c", "Enter")
        self.until("MULNX16C", self.title)

    def test_back_returns_to_the_entry_before(self):
        self.open("#ADDNX16&q=nx16")
        self.run_script("location.hash = '#SUBNX16&q=nx16'")
        self.until("SUBNX16", self.title)
        self.run_script("history.back()")
        self.until("ADDNX16", self.title)

    def test_phone(self):
        self.browser.resize(*PHONE)
        self.open("#q=mul&family=multiply")
        width = "return Math.max(document.documentElement.scrollWidth, document.body.scrollWidth)"
        self.assertLessEqual(self.run_script(width), PHONE[0])
        self.assertEqual(self.run_script("return document.getElementById('entry').offsetParent"), None)
        self.run_script("document.querySelector('#results a').click()")
        self.until(True, lambda: self.run_script("return document.body.classList.contains('opened')"))
        widths = self.run_script("""
            const wide = [...entries].sort((a, b) => b.prototype.length - a.prototype.length).slice(0, 5);
            return [...wide, ...entries.filter((_, i) => i % 50 === 0)].map((entry) => {
              show(entry); return [entry.id, document.documentElement.scrollWidth]; });""")
        self.assertEqual([name for name, pixels in widths if pixels > PHONE[0]], [])
        self.run_script("document.querySelector('.back').click()")
        self.until("#q=mul&family=multiply", self.hash)

    def test_contrast(self):
        for scheme in ("light", "dark"):
            self.browser.prefer(scheme)
            self.open("#LSNX16_IP")
            colours = self.run_script("""
                const of = (name) => getComputedStyle(document.documentElement).getPropertyValue('--' + name).trim();
                return ['text', 'faint', 'accent', 'mark', 'error'].flatMap((ink) =>
                  ['back', 'raised', 'chosen'].map((paper) => [ink, paper, of(ink), of(paper)]));""")
            for ink, paper, *pair in colours:
                self.assertGreaterEqual(contrast(*pair), 4.5, f"{ink} on {paper}, {scheme}")


def contrast(*colours):
    """The contrast of two colours as the accessibility guidelines define it: 4.5 is readable."""
    def luminance(colour):
        parts = [int(colour[i:i + 2], 16) / 255 for i in (1, 3, 5)]
        linear = [p / 12.92 if p <= 0.04045 else ((p + 0.055) / 1.055) ** 2.4 for p in parts]
        return 0.2126 * linear[0] + 0.7152 * linear[1] + 0.0722 * linear[2]
    dark, light = sorted(map(luminance, colours))
    return (light + 0.05) / (dark + 0.05)


if __name__ == "__main__":
    unittest.main()
