"use strict";
(() => {
  const doc = JSON.parse(document.getElementById("document").textContent);
  const byId = (id) => document.getElementById(id);
  const escapes = { "&": "&amp;", "<": "&lt;", ">": "&gt;", '"': "&quot;", "'": "&#39;" };
  const esc = (value) => String(value ?? "").replace(/[&<>"']/g, (c) => escapes[c]);
  const plural = (count, one) => `${count} ${one}${count === 1 ? "" : "s"}`;

  // ---- The model: the LUNs of the documents, with their paths ----------------------------------------------

  const hosts = [];
  const luns = new Map(); // by identifier, or by host and device where there is none
  const paths = [];

  // A path is a device node of a host: the FC tree lists an adapter's LUNs once below each of its ports.
  const pathCount = (list) => list.reduce((sum, entry) => sum + entry.pathCount, 0);

  // Adds a LUN, which each host of `seenBy`, a list of {host, pathCount}, sees.
  function addLun(key, label, seenBy, doubt) {
    const lun = { key, label, vendor: null, product: null, pseudoDevice: null, seenBy, pathCount: pathCount(seenBy),
      doubt: new Set(doubt), names: new Map(), paths: [] };
    luns.set(key, lun);
    return lun;
  }

  // The documents say which paths lead to one LUN; a device that they count to none stands for itself.
  function lunOf(host, { identifier, device }) {
    const key = `device ${host.name} ${device}`;
    return (identifier !== null && luns.get(`id ${identifier}`)) || luns.get(key) ||
      addLun(key, device, [{ host: host.name, pathCount: 1 }]);
  }

  // Notes what other programs call a LUN: each name once, with the programs that use it.
  function addNames(lun, names) {
    const add = (name, program) => name !== null && lun.names.set(name, (lun.names.get(name) ?? new Set()).add(program));
    add(names?.multipath ?? null, "multipath");
    add(names?.scsiId ?? null, "udev");
    add(names?.sg3Rules ?? null, "udev");
    add(names?.kernel ?? null, "kernel");
    for (const link of names?.links ?? []) {
      add(link, "by-id");
    }
  }

  function addPath(host, entry, kind, initiator, target, lunNumber) {
    const lun = lunOf(host, entry);
    for (const field of ["vendor", "product", "pseudoDevice"]) {
      lun[field] = lun[field] ?? entry[field] ?? null;
    }
    const path = { host, kind, initiator, target, lun, device: entry.device, number: lunNumber };
    lun.paths.push(path);
    paths.push(path);
  }

  const [first] = doc.reports;
  const found = doc.san ? doc.san.luns : first.report.luns.map((lun) =>
    ({ ...lun, hosts: [{ host: first.name, pathCount: lun.pathCount }], notUnique: lun.unique ? [] : [lun.notUnique] }));
  for (const lun of found) {
    addLun(`id ${lun.identifier}`, lun.identifier || "(empty)", lun.hosts, lun.notUnique);
  }
  for (const { name, report } of doc.reports) {
    const host = { name, report, initiators: new Map() };
    hosts.push(host);
    for (const adapter of report.fc.adapters) {
      for (const wwpn of adapter.initiators) {
        host.initiators.set(wwpn, { name: wwpn, detail: [adapter.manufacturer, adapter.model].filter(Boolean).join(" ") });
      }
    }
    for (const path of report.fc.paths) {
      addPath(host, path, "FC", path.initiator, path.targetPort, path.lun);
    }
    report.fc.adapters.forEach((adapter) => {
      for (const lun of adapter.unlisted) {
        addPath(host, lun, "FC, not listed", adapter.name, "not listed in the tree", null);
      }
    });
    for (const path of report.iscsi.paths) {
      addPath(host, path, "iSCSI", path.initiatorPort, `${path.targetIqn} ${path.targetAddress}`, path.lun);
    }
    for (const entry of report.luns) {
      const lun = luns.get(`id ${entry.identifier}`);
      if (lun) {
        addNames(lun, entry.names);
      }
    }
    for (const disk of report.direct.devices) {
      addNames(lunOf(host, disk), disk.names);
      addPath(host, disk, "direct", "direct", "attached to the host", null);
    }
  }
  for (const lun of luns.values()) {
    lun.words = [lun.label, lun.vendor, lun.product, lun.pseudoDevice, ...lun.names.keys(),
      ...lun.paths.flatMap((path) => [path.device, path.initiator, path.target, path.host.name])]
      .filter(Boolean).map((word) => word.toLowerCase());
    lun.words = [...new Set(lun.words)];
  }

  // ---- The picture -----------------------------------------------------------------------------------------

  // LUNs seen over the same paths stand in one box, so that a line is drawn for a box and not for each of its
  // LUNs; many LUNs become small squares.
  const rowHeight = 20;
  const square = 9;
  const squaresInRow = 32;
  const labelledLuns = 80;
  const columns = [
    { title: "Host", x: 20, width: 150 },
    { title: "Initiator port", x: 230, width: 215 },
    { title: "Target", x: 505, width: 330 },
    { title: "LUN", x: 895, width: 390 },
  ];
  const nodes = []; // what can be focused, in drawing order
  const edges = new Map();
  const selectable = new Map(); // element number to node

  function nodeOf(map, key, make) {
    let node = map.get(key);
    if (!node) {
      node = { key, children: new Set(), ...make() };
      map.set(key, node);
    }
    return node;
  }

  function layOut() {
    const hostNodes = new Map();
    const initiators = new Map();
    const targets = new Map();
    const boxes = new Map();
    for (const host of hosts) {
      const node = nodeOf(hostNodes, host.name, () => ({ kind: "host", label: host.name, find: host.name }));
      for (const [key, port] of host.initiators) {
        node.children.add(nodeOf(initiators, `${host.name} ${key}`,
          () => ({ kind: "initiator", label: port.name, detail: port.detail, find: port.name, host })));
      }
    }
    for (const lun of luns.values()) {
      const ways = lun.paths.map((path) => `${path.host.name}\n${path.initiator}\n${path.target}`);
      const box = nodeOf(boxes, [...new Set(ways)].sort().join("\n\n"), () => ({ kind: "box", luns: [] }));
      box.luns.push(lun);
      lun.box = box;
      for (const path of lun.paths) {
        const initiator = nodeOf(initiators, `${path.host.name} ${path.initiator}`,
          () => ({ kind: "initiator", label: path.initiator, detail: "", find: path.initiator, host: path.host }));
        hostNodes.get(path.host.name).children.add(initiator);
        const own = path.kind === "direct" || path.kind === "FC, not listed";
        const target = nodeOf(targets, own ? `${path.host.name} ${path.initiator} ${path.target}` : path.target,
          () => ({ kind: "target", label: path.target, find: path.target }));
        initiator.children.add(target);
        target.children.add(box);
        path.nodes = [hostNodes.get(path.host.name), initiator, target, box];
      }
    }
    const labelled = luns.size <= labelledLuns;
    let y = 40;
    for (const box of boxes.values()) {
      box.labelled = labelled;
      const rows = labelled ? box.luns.length : Math.ceil(box.luns.length / squaresInRow);
      box.height = rows * (labelled ? rowHeight : square + 2) + 8;
      box.y = y;
      y += box.height + 8;
    }
    const place = (map) => {
      const list = [...map.values()];
      for (const node of list) {
        const centres = [...node.children].map((child) => child.y + child.height / 2);
        node.height = rowHeight + 2;
        node.wish = centres.length ? centres.reduce((a, b) => a + b, 0) / centres.length - node.height / 2 : 0;
      }
      // A host's ports stand together.
      list.sort((a, b) => hosts.indexOf(a.host) - hosts.indexOf(b.host) || a.wish - b.wish);
      let next = 40;
      for (const node of list) {
        node.y = Math.max(node.wish, next);
        next = node.y + node.height + 6;
      }
      y = Math.max(y, next);
      return list;
    };
    const order = [place(targets), place(initiators), place(hostNodes)];
    return { layers: [order[2], order[1], order[0], [...boxes.values()]], height: y + 20 };
  }

  const shorten = (text, width) => {
    const room = Math.floor((width - 12) / 7.3);
    return text.length <= room ? text : `${text.slice(0, room - 12)}…${text.slice(-11)}`;
  };

  function draw() {
    const { layers, height } = layOut();
    const out = [];
    const width = 1300;
    const connect = (from, to, column) => {
      const x1 = columns[column].x + columns[column].width;
      const x2 = columns[column + 1].x;
      const y1 = from.y + from.height / 2;
      const y2 = to.y + to.height / 2;
      const middle = (x1 + x2) / 2;
      const id = edges.size;
      edges.set(`${column}\n${from.key}\n${to.key}`, id);
      out.push(`<path class="edge" id="e${id}" d="M${x1} ${y1}C${middle} ${y1} ${middle} ${y2} ${x2} ${y2}"/>`);
    };
    layers.slice(0, 3).forEach((layer, column) => {
      for (const node of layer) {
        for (const child of node.children) {
          connect(node, child, column);
        }
      }
    });
    const add = (node) => {
      node.number = nodes.length;
      nodes.push(node);
      selectable.set(node.number, node);
      return `id="n${node.number}" data-n="${node.number}" tabindex="-1" role="button" aria-label="${esc(node.say)}"`;
    };
    layers.slice(0, 3).forEach((layer, column) => {
      const { x, width: w } = columns[column];
      for (const node of layer) {
        node.column = column;
        node.say = `${node.kind} ${node.label}${node.detail ? `, ${node.detail}` : ""}`;
        out.push(`<g class="node ${node.kind}" ${add(node)}><rect x="${x}" y="${node.y}" width="${w}" height="${node.height}" rx="4"/>` +
          `<text x="${x + 6}" y="${node.y + 15}">${esc(shorten(node.label, w))}</text></g>`);
      }
    });
    const { x, width: w } = columns[3];
    for (const box of layers[3]) {
      out.push(`<rect class="box" x="${x}" y="${box.y}" width="${w}" height="${box.height}" rx="4"/>`);
      box.luns.forEach((lun, i) => {
        const doubtful = lun.doubt.size ? " doubtful" : "";
        const node = { kind: "lun", lun, column: 3, find: lun.label, label: lun.label,
          say: `LUN ${[lun.label, lun.vendor, lun.product].filter(Boolean).join(" ")}, ${plural(lun.pathCount, "path")}` };
        lun.node = node;
        if (box.labelled) {
          node.y = box.y + 4 + i * rowHeight;
          out.push(`<g class="node lun${doubtful}" ${add(node)}><rect x="${x + 4}" y="${node.y + 1}" width="${w - 8}" height="${rowHeight - 2}" rx="3"/>` +
            `<text x="${x + 9}" y="${node.y + 14}">${esc(shorten(lun.label, w - 70))}</text>` +
            `<text x="${x + w - 12}" y="${node.y + 14}" text-anchor="end">${plural(lun.pathCount, "path")}</text></g>`);
        } else {
          node.y = box.y + 4 + Math.floor(i / squaresInRow) * (square + 2);
          out.push(`<rect class="lun${doubtful}" ${add(node)} x="${x + 5 + (i % squaresInRow) * (square + 2.8)}" y="${node.y}" width="${square}" height="${square}"/>`);
        }
      });
    }
    const heads = columns.map((c) => `<text class="head" x="${c.x}" y="22">${c.title}</text>`).join("");
    byId("picture").innerHTML =
      `<svg id="svg" role="group" aria-label="Topology: hosts, initiator ports, targets and LUNs" width="${width}" height="${Math.ceil(height)}" viewBox="0 0 ${width} ${Math.ceil(height)}">${heads}${out.join("")}</svg>`;
    if (nodes.length) {
      byId("n0").setAttribute("tabindex", "0");
    }
  }

  // ---- Tables ----------------------------------------------------------------------------------------------

  const sections = [];
  const finder = (text, shown = text) => `<button type="button" class="find" data-find="${esc(text)}">${esc(shown)}</button>`;

  const numeric = new Set(["LUN", "LUNs", "Number", "Paths", "Problems"]);

  function table(id, title, heads, rows) {
    sections.push([id, `${title} (${rows.length})`]);
    const body = rows.length ? rows.join("") : `<tr><td colspan="${heads.length}" class="faint">none</td></tr>`;
    return `<section id="${id}" aria-labelledby="${id}-heading"><h2 id="${id}-heading">${esc(title)} (${rows.length})</h2>` +
      `<div class="table"><table><thead><tr>${heads.map((h) => `<th scope="col"${numeric.has(h) ? ' class="number"' : ""}>${esc(h)}</th>`).join("")}</tr></thead><tbody>${body}</tbody></table></div></section>`;
  }

  const many = hosts.length > 1;
  const hostCell = (host) => (many ? `<td>${esc(host.name)}</td>` : "");
  const hostHead = many ? ["Host"] : [];

  // What differs between the devices and what the kernel and multipath remember of them, when that was asked.
  function verifyHtml() {
    if (!doc.verify) {
      return "";
    }
    const found = doc.verify.findings;
    const path = (p) => `<br>${finder(p.device)} <span class="faint">${p.lun === null ? "" : `LUN ${esc(p.lun)}`} ` +
      `${p.target === null ? "" : `${esc(p.initiator)} → ${esc(p.target)}`}</span> ${p.name === null ? "" : `<code>${esc(p.name)}</code>`}`;
    const item = (f) => `<div class="${f.severity === "danger" ? "problem" : "note"}"><b>${esc(f.meaning)}</b>` +
      `${f.says ? `<br>${esc(f.says)}` : ""}${f.paths.map(path).join("")}<br><span class="faint">${esc(f.advice)}</span></div>`;
    sections.push(["verify", `Compared with the kernel (${found.length})`]);
    return `<h2 id="verify">Compared with the kernel (${found.length})</h2>` +
      (found.map(item).join("") || "<p>Everything agrees.</p>");
  }

  function problemsHtml() {
    const compared = verifyHtml();
    const list = hosts.flatMap((host) => host.report.problems.map((problem) => ({ host, ...problem })));
    for (const lun of luns.values()) {
      for (const reason of doc.san ? lun.doubt : []) {
        if (!list.some((p) => p.kind === "identifier-not-unique" && p.subject === lun.label)) {
          list.push({ host: { name: "SAN" }, severity: "problem", kind: "identifier-not-unique", tree: "san", subject: lun.label, cause: reason, line: null });
        }
      }
    }
    const bad = list.filter((p) => p.severity === "problem");
    const notes = list.filter((p) => p.severity === "note");
    const item = (p) => `<div class="${p.severity}"><b>${esc(p.subject)}</b> <span class="faint">${many ? `${esc(p.host.name)}, ` : ""}${esc(p.tree)}${p.line ? `, line ${p.line}` : ""}</span><br>${esc(p.cause)}</div>`;
    byId("notes").innerHTML = notes.length ? `<h2 id="notes-heading">Notes (${notes.length})</h2>${notes.map(item).join("")}` : "";
    sections.push(["problems", `Problems (${bad.length})`], ["picture-section", "Topology"]);
    const odd = hosts.filter(({ report: { log } }) => log.unknown.count || log.leftoverTexts || log.runs !== 1 || log.cutInLine)
      .map(({ name, report: { log } }) => `<div class="note"><b>${esc(log.name)}</b> <span class="faint">${esc(name)}</span><br>` +
        [log.runs > 1 && `${log.runs} runs, the last one is shown`, log.beginsInside && "its beginning is missing",
          log.cutInLine && "its last line has no end",
          log.leftoverTexts && `${log.leftoverTexts} texts of an older run left out`,
          log.unknown.count && `${plural(log.unknown.count, "piece")} not known, the first in line ${log.unknown.samples[0]?.line}: <code>${esc(log.unknown.samples[0]?.text)}</code>`]
          .filter(Boolean).join("; ") + "</div>");
    return compared + `<h2 id="problems-heading">Problems (${bad.length})</h2>` +
      (bad.map(item).join("") || "<p>None.</p>") +
      (odd.length ? `<h2>The log itself</h2>${odd.join("")}` : "");
  }

  function tablesHtml() {
    const out = [];
    if (many) {
      out.push(table("hosts", "Hosts", ["Host", "Log", "LUNs", "Problems", "PowerPath", "Whole"], hosts.map(({ name, report }) =>
        `<tr><td>${finder(name)}</td><td>${esc(report.log.name)}</td><td class="number">${report.luns.length}</td><td class="number">${report.problems.filter((p) => p.severity === "problem").length}</td><td>${esc(report.multipath.powerPath)}</td><td>${report.log.complete ? "yes" : '<span class="bad">no</span>'}</td></tr>`)));
    }
    // Under the identifier, the names of multipath, udev and the kernel; the links, which hold mostly the same digits, are
    // found by the search and shown on demand.
    const namesHtml = (lun) => {
      const list = (wanted) => [...lun.names].filter(([, programs]) => programs.has("by-id") === wanted);
      const names = list(false).map(([name, programs]) => `${esc(name)} <i>${[...programs].join(", ")}</i>`);
      return names.length ? `<div class="names" title="${esc(list(true).map(([link]) => link).join("\n"))}">${names.join("<br>")}</div>` : "";
    };
    const perHost = (lun) => lun.seenBy.map((seen) => `${seen.host} ${seen.pathCount}`).join(", ");
    let number = 0;
    out.push(table("luns", "LUNs", ["Identifier", "Product", "Pseudo device", "Paths", ...(many ? ["Paths of each host"] : []), "Remark"],
      [...luns.values()].map((lun) => {
        lun.row = `l${number++}`;
        const remark = [...lun.doubt].map((d) => `<span class="bad">not unique: ${esc(d)}</span>`).join("<br>") ||
          (many && lun.seenBy.length === 1 ? "one host only" : "");
        return `<tr id="${lun.row}"><td class="key">${finder(lun.label)}${namesHtml(lun)}</td><td>${esc([lun.vendor, lun.product].filter(Boolean).join(" "))}</td><td>${esc(lun.pseudoDevice)}</td><td class="number">${lun.pathCount}</td>${many ? `<td>${esc(perHost(lun))}</td>` : ""}<td>${remark}</td></tr>`;
      })));
    number = 0;
    out.push(table("paths", "Listed paths", [...hostHead, "Device", "Over", "Initiator", "Target", "LUN", "Identifier"],
      paths.map((path) => {
        path.row = `p${number++}`;
        return `<tr id="${path.row}">${hostCell(path.host)}<td class="key name">${esc(path.device)}</td><td>${esc(path.kind)}</td><td class="key name">${esc(path.initiator)}</td><td class="key">${esc(path.target)}</td><td class="number">${path.number ?? ""}</td><td class="key">${esc(path.lun.label)}</td></tr>`;
      })));
    out.push(table("adapters", "Fibre Channel adapters", [...hostHead, "Number", "Name", "Model", "Node", "State"],
      hosts.flatMap((host) => host.report.fc.adapters.map((a) =>
        `<tr>${hostCell(host)}<td class="number">${a.number ?? ""}</td><td>${esc(a.name)}</td><td>${esc([a.manufacturer, a.model].filter(Boolean).join(" "))}</td><td class="key">${esc(a.node)}</td><td>${a.state === "reported" ? "reported" : `<span class="bad">${esc(a.state)}</span> ${esc(a.cause)}`}</td></tr>`))));
    out.push(table("logical", "Logical devices", [...hostHead, "Device"], hosts.flatMap((host) =>
      host.report.logical.devices.map((device) => `<tr>${hostCell(host)}<td class="key name">${esc(device)}</td></tr>`))));
    out.push(table("powerpath", "PowerPath devices", [...hostHead, "Pseudo device", "Logical device"], hosts.flatMap((host) =>
      host.report.multipath.devices.map((d) => `<tr>${hostCell(host)}<td>${esc(d.pseudoDevice)}</td><td class="key">${esc(d.ulid)}</td></tr>`))));
    return out.join("");
  }

  // ---- Search ----------------------------------------------------------------------------------------------

  let marked = [];

  // The LUNs that a text finds: those with a word that is the text, else those with a word that holds it.
  function find(text) {
    const wanted = text.trim().toLowerCase();
    if (!wanted) {
      return null;
    }
    const all = [...luns.values()];
    const exact = all.filter((lun) => lun.words.includes(wanted));
    return exact.length ? exact : all.filter((lun) => lun.words.some((word) => word.includes(wanted)));
  }

  function search(text) {
    for (const element of marked) {
      element.classList.remove("hit");
    }
    marked = [];
    const mark = (element) => {
      if (element && !element.classList.contains("hit")) {
        element.classList.add("hit");
        marked.push(element);
      }
    };
    const hits = find(text);
    byId("svg").classList.toggle("searching", hits !== null);
    const shown = new Set(hits ?? []);
    for (const lun of luns.values()) {
      byId(lun.row).hidden = hits !== null && !shown.has(lun);
    }
    for (const path of paths) {
      const hit = shown.has(path.lun);
      const row = byId(path.row);
      row.hidden = hits !== null && !hit;
      if (hit) {
        mark(row);
        path.nodes.forEach((node, column) => {
          if (column < 3) {
            mark(byId(`n${node.number}`));
            mark(byId(`e${edges.get(`${column}\n${node.key}\n${path.nodes[column + 1].key}`)}`));
          }
        });
      }
    }
    for (const lun of shown) {
      mark(byId(lun.row));
      mark(byId(`n${lun.node.number}`));
    }
    byId("hits").textContent = hits === null ? "" : `${plural(hits.length, "LUN")}, ${plural(pathCount(hits), "path")}`;
    if (hits?.length) {
      const picture = byId("picture");
      picture.scrollTop = Math.max(0, hits[0].node.y - picture.clientHeight / 2);
    }
  }

  // ---- Putting it together ---------------------------------------------------------------------------------

  document.title = doc.title;
  byId("title").textContent = doc.title;
  byId("summary").textContent = [plural(hosts.length, "log"), plural(luns.size, "LUN"), plural(pathCount([...luns.values()]), "path")].join(", ") +
    (many ? "" : `, from ${doc.reports[0].report.log.name}`);
  byId("problems").innerHTML = problemsHtml();
  draw();
  byId("tables").innerHTML = tablesHtml();
  if (byId("notes").hasChildNodes()) {
    sections.push(["notes", byId("notes-heading").textContent]);
  }
  document.querySelector("nav").innerHTML = sections.map(([id, title]) => `<a href="#${id}">${esc(title)}</a>`).join("");

  const input = byId("search");
  let timer = 0;
  const searchNow = () => search(input.value);
  input.addEventListener("input", () => {
    clearTimeout(timer);
    timer = setTimeout(searchNow, 120);
  });
  byId("search-form").addEventListener("submit", (event) => {
    event.preventDefault();
    clearTimeout(timer);
    searchNow();
  });
  const findText = (text) => {
    input.value = text;
    searchNow();
  };
  document.addEventListener("click", (event) => {
    const button = event.target.closest("[data-find]");
    if (button) {
      findText(button.dataset.find);
    }
  });
  document.addEventListener("keydown", (event) => {
    if (event.key === "/" && event.target !== input) {
      event.preventDefault();
      input.focus();
      input.select();
    } else if (event.key === "Escape") {
      findText("");
    }
  });

  const picture = byId("picture");
  const nodeAt = (element) => selectable.get(Number(element?.closest?.("[data-n]")?.dataset.n));
  const say = (node) => {
    byId("caption").textContent = node ? node.say : "";
  };
  picture.addEventListener("click", (event) => {
    const node = nodeAt(event.target);
    if (node) {
      findText(node.find);
      say(node);
    }
  });
  picture.addEventListener("mouseover", (event) => say(nodeAt(event.target)));
  picture.addEventListener("focusin", (event) => say(nodeAt(event.target)));

  // The nearest node in a column, by height.
  const nearest = (column, y) => nodes.filter((node) => node.column === column)
    .reduce((best, node) => (!best || Math.abs(node.y - y) < Math.abs(best.y - y) ? node : best), null);
  picture.addEventListener("keydown", (event) => {
    const node = nodeAt(event.target);
    if (!node) {
      return;
    }
    const column = nodes.filter((other) => other.column === node.column);
    const at = column.indexOf(node);
    const next = {
      ArrowUp: () => column[at - 1],
      ArrowDown: () => column[at + 1],
      ArrowLeft: () => nearest(node.column - 1, node.y),
      ArrowRight: () => nearest(node.column + 1, node.y),
      Home: () => column[0],
      End: () => column[column.length - 1],
    }[event.key]?.();
    if (next) {
      event.preventDefault();
      byId(`n${node.number}`).setAttribute("tabindex", "-1");
      const element = byId(`n${next.number}`);
      element.setAttribute("tabindex", "0");
      element.focus();
    } else if (event.key === "Enter" || event.key === " ") {
      event.preventDefault();
      findText(node.find);
    }
  });
})();
