"use strict";
// The page of a profile. Everything that comes from the query is put into the page as text, with
// the characters made visible that would steer it.
(() => {
  const profile = JSON.parse(document.getElementById("data").textContent);
  const byId = (id) => document.getElementById(id);
  const nodes = profile.calls;
  const expressions = profile.expressions;
  const whole = profile.milliseconds.evaluating;

  // --- texts -------------------------------------------------------------------------------------

  // Control characters, what turns the direction of text, and the ends of lines of scripts.
  const hidden = /[\u0000-\u001f\u007f-\u009f\u061c\u200e\u200f\u2028-\u202e\u2066-\u2069\ufeff]/g;
  const escaped = (unit) =>
    "\\u" + unit.charCodeAt(0).toString(16).toUpperCase().padStart(4, "0");
  const visible = (text) => text.replace(hidden, escaped);
  const ms = (time) => time.toFixed(time < 10 ? 3 : time < 1000 ? 1 : 0);
  const count = (number) => number.toLocaleString("en");
  const counted = (number, one, several) => count(number) + " " + (number === 1 ? one : several);
  const share = (time) => (whole > 0 ? (100 * time) / whole : 0).toFixed(1) + " %";
  const isCounted = (expression) => expression.calls !== undefined;

  function nameOf(expression) {
    const { role = "", label, depth } = expression;
    if (depth > 0) return visible((role ? role + ": " : "") + label);
    return visible(role.replace(/^(function|variable) /, "") + (label ? ": " + label : ""));
  }
  function placeOf(expression) {
    if (!expression.line) return "";
    const { line, module } = expression;
    return "line " + line + (module ? " of " + visible(module) : "");
  }
  const notesOf = (expression) =>
    expression.notes.map((note) => (note.refused ? "not " : "") + note.rule + ": " + note.reason);

  function element(tag, className, text) {
    const made = document.createElement(tag);
    if (className) made.className = className;
    if (text !== undefined) made.textContent = text;
    return made;
  }

  // --- the tree of calls -------------------------------------------------------------------------

  nodes.forEach((node, index) => {
    node.index = index;
    node.parts = [];
    node.about = index ? expressions[node.expression] : null;
    node.name = index ? nameOf(node.about) : "evaluation";
    node.depth = index ? nodes[node.parent].depth + 1 : 0;
    if (index) nodes[node.parent].parts.push(node);
  });
  for (const node of nodes) node.parts.sort((a, b) => b.total - a.total);

  function describe(node) {
    const lines = [node.name];
    if (node.about && placeOf(node.about)) lines[0] += ", " + placeOf(node.about);
    lines.push(ms(node.total) + " ms (" + share(node.total) + "), of it own " + ms(node.own) +
               " ms");
    if (node.about) {
      lines.push(counted(node.calls, "call", "calls") + ", " +
                 counted(node.items, "item", "items"));
    } else {
      lines.push(counted(node.calls, "evaluation", "evaluations"));
    }
    if (node.about && node.about.recursions && node.about.depth === 0) {
      lines.push("recursive calls are added here: " + count(node.about.recursions) + ", up to " +
                 count(node.about.deepest) + " deep");
    }
    if (node.folded) {
      lines.push(counted(node.folded, "call", "calls") + " below it added, for want of room");
    }
    return lines;
  }

  // --- the flame graph ---------------------------------------------------------------------------

  const rowHeight = 21;
  const flame = byId("flame");
  let zoomed = nodes[0];  // as wide as the page
  let focused = nodes[0];
  let isMatch = () => false;
  let selected = new Set();  // of expressions

  const isAbove = (node, other) => {
    while (other && other !== node) other = other.index ? nodes[other.parent] : null;
    return other === node;
  };

  function makeFrame(node, left, width, pixels) {
    const frame = element("div", "frame", pixels > 18 ? node.name : "");
    frame.id = "frame" + node.index;
    frame.style.left = left + "%";
    frame.style.width = width + "%";
    frame.style.top = node.depth * rowHeight + "px";
    frame.style.setProperty("--heat", Math.min(100, (150 * node.own) / (whole || 1)) + "%");
    frame.setAttribute("role", "treeitem");
    frame.setAttribute("aria-level", node.depth + 1);
    frame.setAttribute("aria-label", describe(node).join(". "));
    frame.setAttribute("aria-selected", String(node === zoomed));
    frame.tabIndex = node === focused ? 0 : -1;
    frame.classList.toggle("narrow", pixels < 12);
    frame.classList.toggle("above", node !== zoomed && isAbove(node, zoomed));
    frame.classList.toggle("match", isMatch(node));
    frame.classList.toggle("selected", selected.has(node.expression));
    frame.node = node;
    return frame;
  }

  // In place of parts that are too narrow to be seen.
  function makeRest(node, left, width, narrow) {
    const rest = element("div", "rest");
    rest.style.left = left + "%";
    rest.style.width = width + "%";
    rest.style.top = (node.depth + 1) * rowHeight + "px";
    rest.title = counted(narrow, "bar is", "bars are") + " too narrow to be seen";
    return rest;
  }

  // Parts lie side by side below their whole, in proportion to their time, the longest first.
  function drawFlame() {
    const hadFocus = flame.contains(document.activeElement);
    const frames = document.createDocumentFragment();
    const across = flame.clientWidth || 1000;
    let deepest = 0;
    const waiting = [];
    for (let node = zoomed; ; node = nodes[node.parent]) {
      waiting.push({ node, left: 0, width: 100, isWhole: node === zoomed });
      if (!node.index) break;
    }
    while (waiting.length) {
      const { node, left, width, isWhole } = waiting.pop();
      const pixels = (width * across) / 100;
      deepest = Math.max(deepest, node.depth);
      frames.append(makeFrame(node, left, width, pixels));
      if (!isWhole) continue;
      let start = left;
      let narrow = 0;
      let rest = 0;
      for (const part of node.parts) {
        const partWidth = node.total > 0 ? (width * part.total) / node.total : 0;
        if ((partWidth * across) / 100 >= 1) {
          waiting.push({ node: part, left: start, width: partWidth, isWhole: true });
          start += partWidth;
        } else {
          narrow += 1;
          rest += partWidth;
        }
      }
      if ((rest * across) / 100 >= 3) frames.append(makeRest(node, start, rest, narrow));
    }
    const bed = element("div");
    bed.style.height = (deepest + 1) * rowHeight + "px";
    frames.append(bed);
    flame.replaceChildren(frames);
    if (!frameOf(focused)) focused = zoomed;
    frameOf(focused).tabIndex = 0;
    if (hadFocus) frameOf(focused).focus();
  }
  const frameOf = (node) => byId("frame" + node.index);

  function zoomTo(node) {
    zoomed = node;
    focused = node;
    drawFlame();
    showDetail(node);
  }
  function focusOn(node) {
    if (!frameOf(node)) zoomTo(node.index ? nodes[node.parent] : node);
    if (!frameOf(node)) zoomTo(node);
    const before = frameOf(focused);
    if (before) before.tabIndex = -1;
    focused = node;
    const frame = frameOf(node);
    frame.tabIndex = 0;
    frame.focus({ preventScroll: false });
    showDetail(node);
  }
  function showDetail(node) {
    const paragraphs = describe(node).concat(node.about ? notesOf(node.about) : []);
    byId("detail").replaceChildren(...paragraphs.map((text) => element("p", "", text)));
  }

  // The nearest frame of the same row on that side.
  function beside(node, direction) {
    const row = [...flame.querySelectorAll(".frame")]
      .filter((frame) => frame.node.depth === node.depth)
      .sort((a, b) => parseFloat(a.style.left) - parseFloat(b.style.left));
    const at = row.findIndex((frame) => frame.node === node) + direction;
    return at >= 0 && at < row.length ? row[at].node : node;
  }

  const flameKeys = {
    ArrowUp: () => focusOn(focused.index ? nodes[focused.parent] : focused),
    ArrowDown: () => focusOn(focused.parts[0] || focused),
    ArrowLeft: () => focusOn(beside(focused, -1)),
    ArrowRight: () => focusOn(beside(focused, 1)),
    Home: () => focusOn(nodes[0]),
    Enter: () => zoomTo(focused),
    " ": () => zoomTo(focused),
    Escape: () => zoomTo(zoomed.index ? nodes[zoomed.parent] : zoomed),
  };
  flame.addEventListener("keydown", (event) => {
    if (event.ctrlKey || event.altKey || event.metaKey || !flameKeys[event.key]) return;
    event.preventDefault();
    flameKeys[event.key]();
  });
  flame.addEventListener("click", (event) => {
    const frame = event.target.closest(".frame");
    if (!frame) return;
    zoomTo(frame.node);
    select(frame.node.about ? [frame.node.expression] : [], false);
    frameOf(focused).focus();
  });
  new ResizeObserver(drawFlame).observe(flame);

  const tip = byId("tip");
  function showTip(frame, x, y) {
    tip.textContent = describe(frame.node).join("\n");
    tip.hidden = false;
    const { width, height } = tip.getBoundingClientRect();
    tip.style.left = Math.max(4, Math.min(x + 12, innerWidth - width - 8)) + "px";
    tip.style.top = (y + 16 + height > innerHeight ? Math.max(4, y - height - 8) : y + 16) + "px";
  }
  flame.addEventListener("mousemove", (event) => {
    const frame = event.target.closest(".frame");
    if (frame) showTip(frame, event.clientX, event.clientY);
    else tip.hidden = true;
  });
  flame.addEventListener("mouseleave", () => (tip.hidden = true));
  flame.addEventListener("focusin", (event) => showDetail(event.target.node || focused));

  // --- the query ---------------------------------------------------------------------------------

  const lineRows = [];
  const pieces = [];  // of the text, each within one line and of one expression
  const isHere = (each) => !each.module && each.line > 0;

  // Places count characters, and an end of a line as one, whatever it is made of.
  const textLines = profile.text.replace(/^\ufeff/, "").replace(/\s+$/, "")
    .split(/\r\n|\r|\n/).map((line) => [...line]);
  const lineStarts = [];
  const textLength = textLines.reduce((at, line) => {
    lineStarts.push(at);
    return at + line.length + 1;
  }, 0);

  // From the first character to behind the last one; null where it is not known.
  function spanOf(each) {
    if (!isHere(each) || !each.column || each.line > lineStarts.length) return null;
    const start = lineStarts[each.line - 1] + each.column - 1;
    return { start, end: Math.min(start + each.length, textLength) };
  }
  const spans = expressions.map(spanOf);

  // Where pieces begin or end, and for each character the innermost expression that is counted.
  function cutText() {
    const borders = new Set(lineStarts);
    const owners = new Int32Array(textLength).fill(-1);
    const order = expressions.map((_, index) => index).filter((index) => spans[index]);
    const lengthOf = (index) => spans[index].end - spans[index].start;
    order.sort((a, b) => lengthOf(b) - lengthOf(a) || a - b);
    for (const index of order) {
      const { start, end } = spans[index];
      borders.add(start).add(end);
      if (expressions[index].calls > 0) owners.fill(index, start, end);
    }
    return { borders, owners };
  }
  function addPieces(cell, line, { borders, owners }, most) {
    const first = lineStarts[line];
    const characters = textLines[line];
    for (let from = 0; from < characters.length;) {
      let to = from + 1;
      while (to < characters.length && !borders.has(first + to)) to += 1;
      const owner = owners[first + from];
      const text = characters.slice(from, to).join("").replace(/[^\t]+/g, visible);
      const piece = element("span", owner < 0 ? "" : "piece", text);
      piece.start = first + from;
      if (owner >= 0) {
        const { own } = expressions[owner];
        piece.style.setProperty("--heat", (90 * own) / most + "%");
        piece.title = nameOf(expressions[owner]) + ": own " + ms(own) + " ms (" + share(own) + ")";
        piece.expression = owner;
      }
      pieces.push(piece);
      cell.append(piece);
      from = to;
    }
    if (!characters.length) cell.append(" ");
  }
  function showQuery() {
    const costs = new Map();
    let most = 1e-9;
    for (const each of expressions) {
      if (!isCounted(each) || !isHere(each)) continue;
      const cost = costs.get(each.line) || { own: 0, calls: 0 };
      cost.own += each.own;
      cost.calls += each.calls;
      costs.set(each.line, cost);
      most = Math.max(most, each.own);
    }
    const mostOfLine = Math.max(...[...costs.values()].map((cost) => cost.own), 1e-9);
    const cuts = cutText();
    const rows = document.createDocumentFragment();
    textLines.forEach((_, index) => {
      const cost = costs.get(index + 1);
      const row = element("tr");
      row.append(element("td", "number", String(index + 1)));
      const heat = element("td", "heat", cost && cost.calls ? ms(cost.own) : "");
      heat.style.setProperty("--heat", cost ? (90 * cost.own) / mostOfLine + "%" : "0%");
      row.append(heat, element("td", "", cost && cost.calls ? share(cost.own) : ""));
      const text = element("td", "text");
      addPieces(text, index, cuts, most);
      row.append(text);
      row.dataset.line = index + 1;
      lineRows.push(row);
      rows.append(row);
    });
    byId("query").tBodies[0].replaceChildren(rows);
  }
  // A click on a piece of the text means its expression, one beside it all of the line.
  byId("query").addEventListener("click", (event) => {
    const row = event.target.closest("tr[data-line]");
    if (!row) return;
    const { expression } = event.target;
    if (expression !== undefined) return select([expression], true);
    const line = Number(row.dataset.line);
    select(expressions.flatMap((each, i) => (each.line === line && !each.module ? [i] : [])), true);
  });
  // The text of the expressions, or where that is not known their lines.
  function selectText(indexes) {
    const isChosen = new Uint8Array(textLength);
    for (const index of indexes) {
      if (spans[index]) isChosen.fill(1, spans[index].start, spans[index].end);
    }
    for (const piece of pieces) piece.classList.toggle("selected", isChosen[piece.start] === 1);
    const lines = new Set(indexes.filter((index) => isHere(expressions[index]))
      .map((index) => expressions[index].line));
    lineRows.forEach((row, index) => row.classList.toggle("selected", lines.has(index + 1)));
    return Math.min(...lines);
  }

  // --- the expressions ---------------------------------------------------------------------------

  const planRows = [];
  function addNumbers(row, expression) {
    const { line, module } = expression;
    const ran = isCounted(expression) && expression.calls > 0;
    const part = ran ? Math.min(1, expression.own / (whole || 1)) : 0;
    const heat = element("td", "heat", ran ? ms(expression.own) : "");
    heat.style.setProperty("--heat", 90 * part + "%");
    const calls = expression.inside ? "~" : isCounted(expression) ? count(expression.calls) : "";
    row.append(
      element("td", "", ran ? ms(expression.total) : ""),
      heat,
      element("td", "", ran ? share(expression.own) : ""),
      element("td", "", calls),
      element("td", "", ran ? count(expression.items) : ""),
      element("td", "number", line && !module ? String(line) : ""));
  }
  function addNotes(cell, expression) {
    const note = (text, className = "note") => cell.append(element("div", className, text));
    if (expression.module) note(placeOf(expression));
    if (expression.failures) note(count(expression.failures) + " failed", "note failed");
    if (expression.recursions && expression.depth === 0) {
      note(counted(expression.recursions, "call", "calls") + " within itself, " +
           count(expression.deepest) + " deep");
    }
    for (const text of notesOf(expression)) note(text);
  }
  function planRow(expression, index) {
    const row = element("tr", isCounted(expression) ? "" : "uncounted");
    addNumbers(row, expression);
    const { role, label: text } = expression;
    const label = element("button", "label");
    label.type = "button";
    if (role) label.append(element("span", "role", visible(role) + (text ? ": " : "")));
    label.append(visible(text));
    label.addEventListener("click", () => select([index], false));
    row.cell = element("td", "text");
    row.cell.append(label);
    addNotes(row.cell, expression);
    row.append(row.cell);
    return row;
  }
  function showPlan() {
    const key = byId("order").value;
    const order = expressions.map((_, index) => index);
    if (!planRows.length) planRows.push(...expressions.map(planRow));
    if (key !== "written") {
      order.sort((a, b) => (expressions[b][key] || 0) - (expressions[a][key] || 0) || a - b);
    }
    for (const index of order) {
      const indent = key === "written" ? Math.min(expressions[index].depth, 40) : 0;
      planRows[index].cell.style.paddingLeft = 0.75 + 1.1 * indent + "rem";
    }
    byId("plan").tBodies[0].replaceChildren(...order.map((index) => planRows[index]));
  }
  byId("order").addEventListener("change", showPlan);

  // Shows the expressions in all three places; `toPlan` says what is scrolled to.
  function select(indexes, toPlan) {
    selected = new Set(indexes);
    planRows.forEach((row, index) => row.classList.toggle("selected", selected.has(index)));
    const line = selectText(indexes);
    for (const frame of flame.querySelectorAll(".frame")) {
      frame.classList.toggle("selected", selected.has(frame.node.expression));
    }
    if (!indexes.length) return;
    scrollWithin(byId("plan-scroller"), planRows[indexes[0]]);
    if (!toPlan && lineRows[line - 1]) scrollWithin(byId("query-scroller"), lineRows[line - 1]);
  }
  // Of the table alone: the page stays where it is.
  function scrollWithin(scroller, row) {
    const top = row.offsetTop - scroller.clientHeight / 2;
    if (row.offsetTop < scroller.scrollTop + 30 ||
        row.offsetTop + row.offsetHeight > scroller.scrollTop + scroller.clientHeight) {
      scroller.scrollTop = Math.max(0, top);
    }
  }

  // --- search ------------------------------------------------------------------------------------

  const search = byId("search");
  let found = [];  // nodes, in the order of the tree
  let foundAt = -1;

  // The time of what matches, without what lies below a match.
  function timeOf(matching) {
    let time = 0;
    for (const node of matching) {
      let above = node.index ? nodes[node.parent] : null;
      while (above && !isMatch(above)) above = above.index ? nodes[above.parent] : null;
      if (!above) time += node.total;
    }
    return time;
  }
  function runSearch() {
    const wanted = search.value.toLowerCase();
    const isHit = (text) => wanted !== "" && text.toLowerCase().includes(wanted);
    const matching = new Set();
    expressions.forEach((each, index) => isHit(nameOf(each)) && matching.add(index));
    isMatch = (node) => node.index > 0 && matching.has(node.expression);
    found = nodes.filter(isMatch);
    foundAt = -1;
    planRows.forEach((row, index) => row.classList.toggle("match", matching.has(index)));
    for (const row of lineRows) row.classList.toggle("match", isHit(row.lastChild.textContent));
    byId("matches").textContent = wanted === "" ? "" :
      counted(matching.size, "expression", "expressions") + ", " + ms(timeOf(found)) + " ms (" +
      share(timeOf(found)) + ")";
    drawFlame();
  }
  search.addEventListener("input", runSearch);
  search.addEventListener("keydown", (event) => {
    if (event.key === "Enter" && found.length) {
      foundAt = (foundAt + (event.shiftKey ? found.length - 1 : 1)) % found.length;
      const node = found[foundAt];
      if (!isAbove(zoomed, node)) zoomTo(nodes[0]);
      if (!frameOf(node)) zoomTo(nodes[node.parent]);
      if (!frameOf(node)) zoomTo(node);
      focused = node;
      showDetail(node);
      select([node.expression], false);
    } else if (event.key === "Escape") {
      search.value = "";
      runSearch();
      frameOf(focused).focus();
      event.preventDefault();
    }
  });
  document.addEventListener("keydown", (event) => {
    const isTyping = /^(INPUT|SELECT|TEXTAREA)$/.test(document.activeElement.tagName);
    if (event.key !== "/" || isTyping || event.ctrlKey || event.altKey || event.metaKey) return;
    event.preventDefault();
    search.focus();
    search.select();
  });

  // --- the rest ----------------------------------------------------------------------------------

  function showSummary() {
    const facts = [];
    const tell = (number, one, several) =>
      facts.push([number === 1 ? one : several, count(number)]);
    tell(profile.evaluations, "evaluation", "evaluations");
    if (profile.inputs !== undefined) tell(profile.inputs, "input", "inputs");
    if (profile.failures) facts.push(["failed", count(profile.failures)]);
    for (const [phase, time] of Object.entries(profile.milliseconds)) {
      facts.push([phase === "planning" ? "of it planning" : phase, ms(time) + " ms"]);
    }
    if (profile.memoryPeak) {
      facts.push(["memory at most", (profile.memoryPeak / 1048576).toFixed(1) + " MiB"]);
    }
    for (const [name, text] of facts) {
      const fact = element("div");
      fact.append(element("dt", "", name), element("dd", "", text));
      byId("summary").append(fact);
    }
  }
  const themes = ["system", "light", "dark"];
  byId("theme").addEventListener("click", () => {
    const root = document.documentElement;
    const next = themes[(themes.indexOf(root.dataset.theme || "system") + 1) % themes.length];
    root.dataset.theme = next;
    byId("theme").textContent = "Theme: " + next;
  });
  const folded = nodes.reduce((sum, node) => sum + (node.folded || 0), 0);
  if (folded) {
    byId("flame-notice").hidden = false;
    byId("flame-notice").textContent = "There is no room for every call: " +
      counted(folded, "call has", "calls have") + " been added to the bars around them.";
  }
  if (expressions.some((each) => each.inside)) {
    byId("plan-notice").textContent =
      "~ never evaluated by itself; an operator around it may do its work";
  }
  document.querySelector("main").hidden = false;
  showSummary();
  showQuery();
  showPlan();
  drawFlame();
  showDetail(nodes[0]);
})();
