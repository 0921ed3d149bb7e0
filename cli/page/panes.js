// SPDX-License-Identifier: MIT
// What surrounds the three panes: their sizes, the colours, paper.

// A splitter sets a share of the main part in percent, by pointer and by arrow keys.
function makeSplitter(splitter, property, isAcross, mostPixels = Infinity) {
    const root = document.documentElement;
    const main = splitter.parentElement;
    const set = percent => {
        const share = Math.round(Math.min(90, Math.max(10, percent)));
        root.style.setProperty(property, `${share}%`);
        splitter.setAttribute('aria-valuenow', share);
    };
    const start = parseFloat(getComputedStyle(root).getPropertyValue(property));
    set(Math.min(start, 100 * mostPixels / main.clientHeight));
    splitter.addEventListener('pointerdown', event => splitter.setPointerCapture(event.pointerId));
    splitter.addEventListener('pointermove', event => {
        if (splitter.hasPointerCapture(event.pointerId)) {
            const box = main.getBoundingClientRect();
            set(isAcross ? 100 * (event.clientX - box.left) / box.width : 100 * (event.clientY - box.top) / box.height);
        }
    });
    splitter.addEventListener('keydown', event => {
        const step = { ArrowUp: -2, ArrowLeft: -2, ArrowDown: 2, ArrowRight: 2 }[event.key];
        if (step) {
            event.preventDefault();
            set(Number(splitter.getAttribute('aria-valuenow')) + step);
        }
    });
}

// The choice is kept where the browser lets a file keep something.
function makeTheme(select) {
    const apply = theme => { document.documentElement.dataset.theme = theme; };
    try {
        select.value = localStorage.getItem('netfloor-theme') ?? '';
    } catch { /* a choice for this time */ }
    apply(select.value);
    select.addEventListener('change', () => {
        apply(select.value);
        try {
            localStorage.setItem('netfloor-theme', select.value);
        } catch { /* as above */ }
    });
}

// Paper gets the list, up to a number of packets, and the whole of the chosen packet.
function makePrint(list, wholes) {
    const mostPackets = 500;
    addEventListener('beforeprint', () => {
        list.print(mostPackets);
        wholes.forEach(rows => rows.print(Infinity));
    });
    addEventListener('afterprint', () => [list, ...wholes].forEach(rows => rows.endPrint()));
}
