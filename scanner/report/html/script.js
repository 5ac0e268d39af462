// SPDX-License-Identifier: MIT
// What the HTML report can do with scripts: sort, filter, open by a link, copy commands. It works on the
// elements of the page and on nothing else.
'use strict';
(() => {
  const table = document.getElementById('results');
  const plugins = [...table.tBodies].map((body, index) => ({
    body,
    index,
    row: body.rows[0],
    details: body.rows[1].querySelector('details'),
  }));
  const verdictOf = (plugin) => plugin.row.cells[0].querySelector('.tag').textContent;
  const changeOf = (plugin) => plugin.row.cells[5].textContent;
  const bodyOf = (element) => element.closest('#results > tbody');
  const detailsOf = (body) => body.rows[1].querySelector('details');

  // --- Sorting

  const collator = new Intl.Collator('en', {numeric: true, sensitivity: 'base'});
  // As the page lists them, which is worst first.
  const ranks = (name) => {
    const words = [...document.querySelectorAll(`.counts [data-${name}]`)].map((item) => item.dataset[name]);
    return (word) => (words.includes(word) ? words.indexOf(word) : words.length);
  };
  const rankOfVerdict = ranks('verdict');
  const rankOfChange = ranks('change');
  const byText = (column) => (plugin) => plugin.row.cells[column].textContent;
  // What has no value comes last, whatever the direction.
  const byNumber = (text) => (plugin) => {
    const number = parseFloat(text(plugin));
    return Number.isNaN(number) ? null : number;
  };
  const keys = [
    (plugin) => rankOfVerdict(verdictOf(plugin)),
    byText(1),
    (plugin) => byText(2)(plugin) || null,
    byNumber(byText(3)),
    byNumber((plugin) => plugin.row.cells[4].dataset.seconds),
    (plugin) => rankOfChange(changeOf(plugin)),
  ];

  const compare = (one, other) =>
    (typeof one === 'string' ? collator.compare(one, other) : one - other);

  const sort = (column, isDescending) => {
    const sign = isDescending ? -1 : 1;
    const order = plugins.map((plugin) => ({plugin, key: keys[column](plugin)}));
    order.sort((one, other) => {
      if (one.key === null || other.key === null) {
        return (one.key === null) - (other.key === null) || one.plugin.index - other.plugin.index;
      }
      return sign * compare(one.key, other.key) || one.plugin.index - other.plugin.index;
    });
    const sorted = document.createDocumentFragment();
    for (const {plugin} of order) sorted.append(plugin.body);
    table.append(sorted);
  };

  const headers = [...table.tHead.rows[0].cells];
  headers.forEach((header, column) => {
    const button = document.createElement('button');
    button.type = 'button';
    button.append(...header.childNodes);
    header.append(button);
    header.setAttribute('aria-sort', 'none');
    button.addEventListener('click', () => {
      const isDescending = header.getAttribute('aria-sort') === 'ascending';
      for (const other of headers) other.setAttribute('aria-sort', 'none');
      header.setAttribute('aria-sort', isDescending ? 'descending' : 'ascending');
      sort(column, isDescending);
    });
  });

  // --- Filtering

  const filter = document.getElementById('filter');
  const shown = document.getElementById('shown');
  const nothing = document.getElementById('nothing');
  const chosen = {verdict: new Set(), change: new Set()};

  const textOf = (plugin) => {
    if (plugin.text === undefined) {
      plugin.text = plugin.row.textContent.toLowerCase();
    }
    return plugin.text;
  };

  const applyFilter = () => {
    const words = filter.value.toLowerCase().split(/\s+/).filter(Boolean);
    let count = 0;
    for (const plugin of plugins) {
      const fits = (chosen.verdict.size === 0 || chosen.verdict.has(verdictOf(plugin))) &&
        (chosen.change.size === 0 || chosen.change.has(changeOf(plugin))) &&
        words.every((word) => textOf(plugin).includes(word));
      if (plugin.body.hidden === fits) plugin.body.hidden = !fits;
      if (fits) count += 1;
    }
    shown.textContent = count === plugins.length ? '' : `${count} of ${plugins.length} shown`;
    nothing.hidden = count > 0 || plugins.length === 0;
  };

  filter.addEventListener('input', applyFilter);
  document.querySelector('.tools').hidden = false;

  for (const name of Object.keys(chosen)) {
    for (const item of document.querySelectorAll(`.counts [data-${name}]`)) {
      const button = document.createElement('button');
      button.type = 'button';
      button.setAttribute('aria-pressed', 'false');
      button.append(...item.childNodes);
      item.append(button);
      button.addEventListener('click', () => {
        const isPressed = !chosen[name].delete(item.dataset[name]);
        if (isPressed) chosen[name].add(item.dataset[name]);
        button.setAttribute('aria-pressed', String(isPressed));
        applyFilter();
      });
    }
  }

  // --- Details

  const copy = async (text) => {
    try {
      await navigator.clipboard.writeText(text);
      return true;
    } catch {
      return false;
    }
  };

  const addCopyButtons = (details) => {
    for (const command of details.querySelectorAll('.command')) {
      if (command.querySelector('button')) continue;
      const text = command.textContent;
      const button = document.createElement('button');
      button.type = 'button';
      button.textContent = 'Copy';
      button.addEventListener('click', async () => {
        const isCopied = await copy(text);
        // Where the clipboard is out of reach the user copies what is selected.
        if (!isCopied) getSelection().setBaseAndExtent(command, 0, command, command.childNodes.length - 1);
        button.textContent = isCopied ? 'Copied' : 'Selected';
        setTimeout(() => { button.textContent = 'Copy'; }, 2000);
      });
      command.append(button);
    }
  };

  // The details of most plug-ins are text until they are wanted. Their markup is the report's own.
  const unpack = (details) => {
    const packed = details.querySelector('noscript');
    if (packed) packed.outerHTML = packed.textContent;
  };

  // Opening a plug-in puts its name into the address, so that the address can be handed on.
  table.addEventListener('toggle', (event) => {
    const details = event.target;
    const body = bodyOf(details);
    if (!body || details !== detailsOf(body) || !details.open || isPrinting) return;
    unpack(details);
    addCopyButtons(details);
    history.replaceState(null, '', `#${body.id}`);
  }, true);

  table.addEventListener('click', (event) => {
    const row = event.target.closest('.row');
    if (!row || !getSelection().isCollapsed) return;
    const details = detailsOf(bodyOf(row));
    details.open = !details.open;
  });

  const openByAddress = () => {
    let name = location.hash.slice(1);
    try {
      name = decodeURIComponent(name);
    } catch {
      return;
    }
    const body = name && document.getElementById(name);
    if (!body || body.tagName !== 'TBODY') return;
    if (body.hidden) {
      filter.value = '';
      for (const button of document.querySelectorAll('.counts [aria-pressed="true"]')) button.click();
      applyFilter();
    }
    const details = detailsOf(body);
    details.open = true;
    body.scrollIntoView({block: 'start'});
    details.querySelector('summary').focus({preventScroll: true});
  };
  addEventListener('hashchange', openByAddress);

  // --- Keyboard

  const step = (from, direction) => {
    const side = direction > 0 ? 'nextElementSibling' : 'previousElementSibling';
    let body = from[side];
    while (body && (body.hidden || body.tagName !== 'TBODY')) body = body[side];
    return body;
  };

  const edge = (isLast) => {
    const bodies = [...table.tBodies].filter((body) => !body.hidden);
    return isLast ? bodies[bodies.length - 1] : bodies[0];
  };

  addEventListener('keydown', (event) => {
    if (event.ctrlKey || event.metaKey || event.altKey) return;
    const target = event.target;
    if (event.key === '/' && target !== filter) {
      filter.focus();
      event.preventDefault();
      return;
    }
    if (event.key === 'Escape' && target === filter) {
      filter.value = '';
      applyFilter();
      return;
    }
    const body = target.tagName === 'SUMMARY' && bodyOf(target);
    if (!body || target.parentElement !== detailsOf(body)) return;
    const goal = {
      ArrowDown: () => step(body, 1),
      ArrowUp: () => step(body, -1),
      Home: () => edge(false),
      End: () => edge(true),
    }[event.key];
    const next = goal && goal();
    if (next) {
      next.rows[1].querySelector('summary').focus();
      event.preventDefault();
    }
  });

  // --- Printing: browsers that cannot show closed details by a style need them open.

  let isPrinting = false;
  let openedForPrint = [];
  addEventListener('beforeprint', () => {
    isPrinting = true;
    openedForPrint = plugins.filter(({body, details}) =>
      body.classList.contains('unwanted') && !body.hidden && !details.open);
    for (const {details} of openedForPrint) {
      unpack(details);
      details.open = true;
    }
  });
  addEventListener('afterprint', () => {
    for (const {details} of openedForPrint) details.open = false;
    openedForPrint = [];
    isPrinting = false;
  });

  document.documentElement.classList.add('scripted');
  openByAddress();
})();
