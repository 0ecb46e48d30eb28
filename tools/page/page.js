"use strict";
// The page is complete without this: it adds a filter, and the lines of pages with very many keys.
(() => {
  const svg = "http://www.w3.org/2000/svg";
  const letters = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz";
  const maxRows = 500;

  function make(tag, className, ...children) {
    const element = document.createElement(tag);
    element.className = className;
    element.append(...children);
    return element;
  }

  // "A3-b2": three days at the lowest, one without a value, two further up.
  function drawn(course) {
    const days = [];
    for (const [, letter, count] of course.matchAll(/([A-Za-z-])(\d*)/g)) {
      for (let i = 0; i < (count || 1); ++i) days.push(letters.indexOf(letter));
    }
    let steps = "", isBroken = true, end = "";
    days.forEach((level, i) => {
      if (level < 0) {
        isBroken = true;
        return;
      }
      const place = Math.round(5 + 290 * (days.length > 1 ? i / (days.length - 1) : .5)) + " " +
        Math.round(94 - level / 51 * 79);
      steps += (isBroken ? "M" + place + "h0L" : "L") + place;
      end = "M" + place + "h0";
      isBroken = false;
    });
    const picture = document.createElementNS(svg, "svg");
    picture.setAttribute("class", "l");
    picture.setAttribute("viewBox", "0 0 300 99");
    picture.setAttribute("preserveAspectRatio", "none");
    picture.setAttribute("aria-hidden", "true");
    for (const [kind, d] of [["m", steps], ["e", end]]) {
      const path = document.createElementNS(svg, "path");
      path.setAttribute("class", kind);
      path.setAttribute("d", d);
      picture.append(path);
    }
    return picture;
  }

  function rowOf(line) {
    const [key, newest, lowest, highest, course] = line.split("\t");
    const head = make("th", "", make("bdi", "", key));
    head.scope = "row";
    return make("tr", "", head, make("td", "", drawn(course)), make("td", "", newest),
      make("td", "", ""), make("td", "", lowest || newest), make("td", "", highest || newest));
  }

  // Lines of text become a table when they are seen.
  function draw(text, words) {
    const all = text.textContent.split("\n").slice(1, -1);
    const lines = all.filter(line => has(line.slice(0, line.indexOf("\t")), words));
    const head = make("tr", "");
    for (const title of ["Key", "Over the days", "Newest", "", "Lowest", "Highest"]) {
      const cell = make("th", "", title);
      cell.scope = "col";
      head.append(cell);
    }
    const rows = make("tbody", "", ...lines.slice(0, maxRows).map(rowOf));
    const table = make("table", "keys", make("thead", "", head), rows);
    if (text.nextSibling) text.nextSibling.remove();
    const rest = lines.length - maxRows;
    text.after(make("div", "", table, rest > 0 ? make("p", "", rest + " more: use the filter") : ""));
    text.hidden = true;
  }

  document.addEventListener("toggle", event => {
    const text = event.target.open && event.target.querySelector(":scope > pre.rows");
    if (text && !text.hidden) draw(text, []);
  }, true);

  const has = (text, words) => words.every(word => text.toLowerCase().includes(word));

  const tools = document.getElementById("tools");
  if (!tools) return;
  const input = make("input", "");
  input.type = "search";
  input.id = "filter";
  input.placeholder = "Filter keys";
  const label = make("label", "", "Filter keys ");
  label.htmlFor = "filter";
  const found = make("output", "");
  tools.append(label, input, " ", found);
  const wereOpen = new Map();

  function filter() {
    const words = input.value.toLowerCase().split(/\s+/).filter(Boolean);
    let count = 0;
    for (const group of document.querySelectorAll("main > section > details")) {
      let hits = 0;
      const text = group.querySelector(":scope > pre");
      if (text) {
        const lines = text.textContent.split("\n").slice(text.className === "rows" ? 1 : 0, -1);
        hits = lines.filter(line => has(line.split("\t", 1)[0], words)).length;
        if (text.className === "rows" && words.length > 0 && hits > 0) draw(text, words);
        if (words.length === 0 && text.hidden && text.nextSibling) draw(text, []);
      } else {
        for (const row of group.querySelectorAll(
          ":scope > table.keys > tbody > tr, :scope > ul.names > li")) {
          const name = row.querySelector("summary") || row.querySelector("th") || row;
          row.hidden = !has(name.textContent, words);
          hits += !row.hidden;
        }
        if (!group.querySelector(":scope > table.keys, :scope > ul.names")) continue;
      }
      if (!wereOpen.has(group)) wereOpen.set(group, group.open);
      group.hidden = words.length > 0 && hits === 0;
      group.open = words.length > 0 ? hits > 0 : wereOpen.get(group);
      count += hits;
    }
    if (words.length === 0) wereOpen.clear();
    found.textContent = words.length > 0 ? count.toLocaleString() + " found" : "";
  }

  let wait = 0;
  input.addEventListener("input", () => {
    clearTimeout(wait);
    wait = setTimeout(filter, 120);
  });
  document.addEventListener("keydown", event => {
    if (event.key === "/" && event.target !== input) {
      event.preventDefault();
      input.focus();
    } else if (event.key === "Escape" && event.target === input) {
      input.value = "";
      filter();
    }
  });
})();
