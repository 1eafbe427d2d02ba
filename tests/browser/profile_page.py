#!/usr/bin/env python3
"""Opens pages that `xquery --profile` writes in a headless Chromium and uses them.

    tests/browser/profile_page.py build/release/xquery [FOLDER FOR SCREENSHOTS]

Ends with status 77, saying so, where there is no Chromium (Debian: apt-get install chromium).
"""

import json
import os
import subprocess
import sys
import tempfile
import unittest

sys.dont_write_bytecode = True
from devtools import Browser, browser_path

COMMAND = ""
SCREENSHOTS = None

QUERY = """declare function local:fib($n) {
  if ($n < 2) then $n else local:fib($n - 1) + local:fib($n - 2)
};
declare function local:slow($k) {
  sum(for $i in 1 to 4000 return $i * $k mod 7)
};
for $k in 1 to 20
let $x := local:slow($k)
where $x > 0
order by $x descending
return <row k="{ $k }">{ local:fib(10 + $k idiv 3), count((1 to 30)[. mod $k = 0]) }</row>
"""

HOSTILE = """("</script><script>document.title = 'taken'</script>",
 "<img src=x onerror='document.title=1'>", "\u202e\u2028\u0085", "&amp;&#x1F600;")
(: <!-- <script> ]]> ${alert(1)} `\\u003c \x7f :)
"""


def large_query():
    """More than 500 expressions, on 5,000 lines."""
    lines = ["("]
    for i in range(600):
        lines.append(f"count((1 to {i % 50 + 1})[. mod {i % 7 + 2} = 0]),")
    lines += ["(: " + "wide " * 60 + f"{i} :)" for i in range(4400)]
    return "\n".join(lines + ["0)"])


class ProfilePage(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.folder = tempfile.TemporaryDirectory()
        cls.browser = Browser()

    @classmethod
    def tearDownClass(cls):
        cls.browser.close()
        cls.folder.cleanup()

    def open(self, name, query):
        path = os.path.join(self.folder.name, name)
        if not os.path.exists(path + ".html"):
            with open(path + ".xq", "w", encoding="utf-8") as file:
                file.write(query)
            subprocess.run([COMMAND, "--profile", path + ".html", path + ".xq"], check=True,
                           stdout=subprocess.DEVNULL)
        self.browser.prefer("light")
        self.browser.open(path + ".html")

    def tearDown(self):
        self.assertEqual(self.browser.problems(), [])

    def shot(self, name):
        if SCREENSHOTS:
            self.browser.screenshot(os.path.join(SCREENSHOTS, name + ".png"))

    def run_script(self, script):
        return self.browser.run(script)

    def count(self, selector):
        return self.run_script(f"document.querySelectorAll({json.dumps(selector)}).length")

    def text(self, name):
        return self.run_script(f"document.getElementById({json.dumps(name)}).innerText")

    def frames(self, condition="true"):
        """The names of the bars for which the condition on `frame` holds."""
        return self.run_script(
            "[...document.querySelectorAll('.frame')].filter((frame) => " + condition + ")"
            ".map((frame) => frame.node.name)")

    def focused(self):
        return self.run_script("document.activeElement.node && document.activeElement.node.name")

    def widest(self):
        return self.frames("frame.style.width === '100%' && !frame.classList.contains('above')")[0]

    def detail(self):
        return self.run_script("document.getElementById('detail').textContent")

    def background(self):
        return self.run_script("getComputedStyle(document.body).backgroundColor")

    # --- what is shown ---------------------------------------------------------------------------

    def test_shows_query_expressions_and_graph(self):
        self.open("plain", QUERY)
        self.assertEqual(self.count("#query tbody tr"), 11)
        self.assertIn("local:fib(...)", self.text("plan"))
        names = self.frames()
        for name in ("evaluation", "local:fib#1: if", "query: FLWOR"):
            self.assertIn(name, names)
        self.assertIn("evaluating", self.text("summary"))
        self.shot("light")

    def test_bars_lie_within_those_above_them(self):
        self.open("plain", QUERY)
        self.assertTrue(self.run_script("""[...document.querySelectorAll('.frame')].every((f) => {
          if (!f.node.index) return true;
          const whole = document.getElementById('frame' + f.node.parent);
          const a = f.getBoundingClientRect(), b = whole.getBoundingClientRect();
          return a.left >= b.left - 1 && a.right <= b.right + 1 && a.top >= b.bottom; })"""))

    def test_times_of_lines_are_those_of_their_expressions(self):
        self.open("plain", QUERY)
        hot = self.run_script("""[...document.querySelectorAll('#query tbody tr')].map((row) =>
          [Number(row.cells[1].textContent), row.cells[3].textContent])
          .sort((a, b) => b[0] - a[0])[0][1]""")
        self.assertIn(hot.strip()[:8], ("sum(for ", "if ($n <"))

    def test_everything_has_a_text_for_those_who_do_not_see_it(self):
        self.open("plain", QUERY)
        labels = self.run_script("[...document.querySelectorAll('.frame')].map((f) => "
                                 "f.getAttribute('aria-label'))")
        for label in labels:
            self.assertRegex(label, r" ms \(\d+\.\d %\), of it own .* (call|evaluation)s?")
        self.assertEqual(self.count("#flame [role=treeitem]:not([aria-level])"), 0)

    # --- mouse -----------------------------------------------------------------------------------

    def frame_named(self, name):
        number = self.run_script(
            "[...document.querySelectorAll('.frame')].find((f) => f.node.name.startsWith("
            f"{name!r})).node.index")
        return f"#frame{number}"

    def test_pointing_at_a_bar_shows_its_numbers(self):
        self.open("plain", QUERY)
        self.browser.point_at(self.frame_named("local:slow"))
        tip = self.text("tip")
        self.assertIn("local:slow", tip)
        self.assertIn("20 calls", tip)
        self.shot("tip")

    def test_clicking_zooms_in_and_selects(self):
        self.open("plain", QUERY)
        self.browser.click(self.frame_named("local:slow#1"))
        self.assertTrue(self.widest().startswith("local:slow#1"))
        self.assertEqual(self.count("#plan tr.selected"), 1)
        self.assertEqual(self.run_script(
            "document.querySelector('#query tr.selected').dataset.line"), "5")
        self.shot("zoomed")
        self.browser.click("#frame0")
        self.assertEqual(self.widest(), "evaluation")

    def test_clicking_a_line_selects_its_expressions(self):
        self.open("plain", QUERY)
        self.browser.click("#query tr[data-line='2'] td.number")
        self.assertGreater(self.count("#plan tr.selected"), 3)
        self.assertTrue(self.frames("frame.classList.contains('selected')"))

    def selected_text(self):
        return self.run_script("[...document.querySelectorAll('#query span.selected')]"
                               ".map((piece) => piece.textContent).join('')")

    def test_the_text_is_as_hot_as_its_innermost_expression(self):
        self.open("plain", QUERY)
        self.assertEqual(self.run_script("[...document.querySelectorAll('#query td.text')]"
                                         ".map((cell) => cell.textContent).join('\\n')"),
                         QUERY.rstrip())
        titles = self.run_script("[...document.querySelectorAll('.piece')].map((p) =>"
                                 " [p.textContent.trim(), p.title.replace(/: own .*/, '')])")
        owners = {text: title.split(": ")[-1] for text, title in titles}
        for text, owner in (("local:fib(", "local:fib(...)"), ("$n - 1", "-"), ("mod 7", "mod"),
                            ("order by", "FLWOR"), ("local:slow($k)", "local:slow(...)")):
            self.assertEqual(owners[text], owner)
        self.assertTrue(self.run_script("""(() => {
          const pieces = [...document.querySelectorAll('.piece')];
          const heat = (piece) => parseFloat(piece.style.getPropertyValue('--heat'));
          const hottest = pieces.sort((a, b) => heat(b) - heat(a))[0];
          const own = JSON.parse(document.getElementById('data').textContent).expressions
            .map((each) => each.own || 0);
          const most = Math.max(...pieces.map((piece) => own[piece.expression]));
          return heat(hottest) > 0 && own[hottest.expression] === most; })()"""))

    def test_clicking_a_piece_of_the_text_selects_its_expression(self):
        self.open("plain", QUERY)
        name = self.run_script("""(() => {
          const piece = [...document.querySelectorAll('#query tr[data-line="5"] .piece')][0];
          piece.id = 'wanted';
          return piece.title; })()""")
        self.browser.click("#wanted")
        self.assertEqual(self.count("#plan tr.selected"), 1)
        self.assertIn("sum(...): own", name)
        self.assertTrue(self.run_script(
            "document.querySelector('#plan tr.selected .label').textContent").endswith("sum(...)"))
        self.assertTrue(self.selected_text().startswith("sum(for $i in 1 to 4000"))

    def test_places_count_characters(self):
        self.open("wide", "\ufeffcount(('\U0001f600', 'e\u0301'))\r\n+ count((\t'b', (1 to 3)))")
        self.run_script("[...document.querySelectorAll('#plan .label')].filter((label) =>"
                        " label.textContent.includes('count('))[1].click()")
        self.assertEqual(self.selected_text(), "count((\t'b', (1 to 3)))")

    def test_expressions_can_be_sorted(self):
        self.open("plain", QUERY)
        self.run_script("(() => { const o = document.getElementById('order'); o.value = 'own';"
                        " o.dispatchEvent(new Event('change')); })()")
        own = self.run_script("[...document.querySelectorAll('#plan tbody tr')].map((row) => "
                              "Number(row.cells[1].textContent.replace(',', '')))")
        self.assertEqual(own, sorted(own, reverse=True))

    # --- keyboard --------------------------------------------------------------------------------

    def test_arrows_move_enter_zooms_escape_goes_back(self):
        self.open("plain", QUERY)
        self.run_script("document.getElementById('frame0').focus()")
        self.assertEqual(self.focused(), "evaluation")
        self.browser.key("ArrowDown")
        self.assertEqual(self.focused(), "query: FLWOR")
        self.browser.key("ArrowDown")
        first = self.focused()
        self.assertIn(first, self.detail())
        self.browser.key("ArrowRight")
        second = self.focused()
        self.assertNotEqual(first, second)
        self.browser.key("ArrowLeft")
        self.assertEqual(self.focused(), first)
        self.browser.key("Enter")
        self.assertEqual(self.widest(), first)
        self.assertEqual(self.focused(), first)
        self.browser.key("Escape")
        self.assertEqual(self.widest(), "query: FLWOR")
        self.browser.key("Escape")
        self.assertEqual(self.widest(), "evaluation")
        self.browser.key("ArrowDown")
        self.browser.key("ArrowUp")
        self.assertEqual(self.focused(), "evaluation")

    def test_arrow_down_reaches_the_end_of_every_branch(self):
        self.open("plain", QUERY)
        self.run_script("document.getElementById('frame0').focus()")
        for _ in range(40):
            self.browser.key("ArrowDown")
        self.assertEqual(self.run_script("document.activeElement.node.parts.length"), 0)

    def test_only_one_bar_is_a_stop_of_the_tab_key(self):
        self.open("plain", QUERY)
        self.assertEqual(self.count(".frame[tabindex='0']"), 1)

    # --- search ----------------------------------------------------------------------------------

    def test_slash_searches(self):
        self.open("plain", QUERY)
        self.browser.key("/")
        self.assertEqual(self.run_script("document.activeElement.id"), "search")
        self.browser.type("FIB")
        self.assertRegex(self.run_script("document.getElementById('matches').textContent"),
                         r"^4 expressions, [\d.]+ ms \([\d.]+ %\)$")
        matching = self.frames("frame.classList.contains('match')")
        self.assertTrue(matching)
        self.assertTrue(all("fib" in name for name in matching))
        self.shot("search")
        self.browser.key("Enter")
        self.assertIn("fib", self.detail())
        self.assertEqual(self.run_script("document.activeElement.id"), "search")
        self.browser.key("Escape")
        self.assertEqual(self.frames("frame.classList.contains('match')"), [])
        self.assertNotEqual(self.run_script("document.activeElement.id"), "search")

    def test_search_without_a_match(self):
        self.open("plain", QUERY)
        self.browser.key("/")
        self.browser.type("no such thing")
        self.assertTrue(self.run_script("document.getElementById('matches').textContent")
                        .startswith("0 expressions, 0.000 ms"))
        self.browser.key("Enter")

    # --- light and dark --------------------------------------------------------------------------

    def test_light_and_dark_as_the_system_has_it(self):
        self.open("plain", QUERY)
        light = self.background()
        self.browser.prefer("dark")
        dark = self.background()
        self.assertNotEqual(light, dark)
        self.shot("dark")
        self.browser.click("#theme")
        self.assertEqual(self.background(), light)
        self.browser.click("#theme")
        self.assertEqual(self.background(), dark)
        self.browser.prefer("light")
        self.assertEqual(self.background(), dark)
        self.browser.click("#theme")
        self.assertEqual(self.background(), light)

    def test_texts_can_be_read_on_their_ground(self):
        """WCAG 2: a contrast of 4.5 at least, light and dark."""
        self.open("plain", QUERY)
        for scheme in ("light", "dark"):
            self.browser.prefer(scheme)
            worst = self.run_script("""(() => {
              const canvas = document.createElement('canvas')
                .getContext('2d', { willReadFrequently: true });
              const rgb = (colors) => {
                for (const color of colors) {
                  canvas.fillStyle = color;
                  canvas.fillRect(0, 0, 1, 1);
                }
                return [...canvas.getImageData(0, 0, 1, 1).data].slice(0, 3); };
              const light = (colors) => rgb(colors).map((v) => (v /= 255) <= 0.03928 ? v / 12.92
                : ((v + 0.055) / 1.055) ** 2.4)
                .reduce((sum, v, i) => sum + v * [0.2126, 0.7152, 0.0722][i], 0);
              // From the page up to the element: some are drawn through.
              const ground = (e) => (e ? [...ground(e.parentElement),
                getComputedStyle(e).backgroundColor] : ['white']);
              let worst = [99, ''];
              for (const e of document.querySelectorAll(
                  '.frame:not(.above), td, th, p, dt, dd, h1, h2, .note, .role, button, .piece')) {
                if (!e.textContent.trim()) continue;
                const [a, b] = [light([getComputedStyle(e).color]), light(ground(e))];
                const contrast = (Math.max(a, b) + 0.05) / (Math.min(a, b) + 0.05);
                const name = e.className + ' ' + e.textContent.slice(0, 30);
                if (contrast < worst[0]) worst = [contrast, name];
              }
              return worst; })()""")
            self.assertGreaterEqual(worst[0], 4.5, (scheme, worst))

    # --- hostile and large -----------------------------------------------------------------------

    def test_hostile_texts_stay_texts(self):
        self.open("hostile", HOSTILE)
        self.assertEqual(self.run_script("document.title"),
                         "Profile of " + os.path.join(self.folder.name, "hostile.xq"))
        self.assertEqual(self.run_script("document.images.length"), 0)
        text = self.text("query")
        self.assertIn("</script><script>", text)
        self.assertIn("\\u202E", text)
        self.assertNotIn("\u202e", self.run_script("document.body.innerText"))

    def test_stays_usable_when_large(self):
        self.open("large", large_query())
        self.assertGreater(self.count("#plan tbody tr"), 500)
        self.assertEqual(self.count("#query tbody tr"), 5002)
        took = self.run_script("""(async () => {
          const frame = () => new Promise((done) => requestAnimationFrame(done));
          const times = [];
          for (const act of [
            () => { const s = document.getElementById('search'); s.value = 'count';
                    s.dispatchEvent(new Event('input')); },
            () => document.querySelectorAll('.frame')[2].click(),
            () => document.getElementById('frame0').click(),
            () => document.querySelectorAll('#query tbody tr')[300].cells[3].click(),
          ]) {
            const start = performance.now();
            act();
            await frame();
            document.body.getBoundingClientRect();
            times.push(performance.now() - start);
          }
          return times; })()""")
        self.assertLess(max(took), 1500, took)
        self.shot("large")
        self.browser.prefer("dark")
        self.shot("large-dark")

    def test_what_has_no_room_is_told_of(self):
        deep = "1"
        for _ in range(300):
            deep = f"count(({deep}, 2))"
        self.open("deep", deep)
        self.assertIn("There is no room for every call", self.text("flame-notice"))

    def test_many_short_bars_leave_a_mark(self):
        self.open("many", "(" + "\n".join(f"count((1 to {i}))," for i in range(3000)) + "0)")
        self.assertEqual(self.count(".rest"), 1)
        self.assertRegex(self.run_script("document.querySelector('.rest').title"), r"^[\d,]+ bars are")

    def test_a_narrow_window_holds_everything(self):
        self.open("plain", QUERY)
        self.browser.send("Emulation.setDeviceMetricsOverride", width=420, height=900,
                          deviceScaleFactor=1, mobile=False)
        self.browser.settle()
        across = self.run_script("document.documentElement.scrollWidth")
        self.shot("narrow")
        self.browser.send("Emulation.setDeviceMetricsOverride", width=1400, height=1000,
                          deviceScaleFactor=1, mobile=False)
        self.assertLessEqual(across, 420)

    def test_without_a_single_measure_there_is_a_page(self):
        self.open("literal", "1")
        self.assertEqual(self.frames()[0], "evaluation")


if __name__ == "__main__":
    COMMAND = os.path.abspath(sys.argv[1])
    if len(sys.argv) > 2:
        SCREENSHOTS = os.path.abspath(sys.argv[2])
        os.makedirs(SCREENSHOTS, exist_ok=True)
    if not browser_path():
        print("skipped: no chromium is installed")
        sys.exit(77)
    unittest.main(argv=sys.argv[:1])
