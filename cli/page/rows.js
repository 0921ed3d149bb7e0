// SPDX-License-Identifier: MIT
// Rows of one height in a pane that scrolls. Only those in sight are in the document, so that a list of any length is
// shown at once.

const spareRows = 8; // above and below what is in sight

class Rows {
    // `draw` makes the element of a row by its index.
    constructor(pane, draw) {
        this.pane = pane;
        this.body = pane.querySelector('.rows');
        this.head = pane.querySelector('.head');
        this.draw = draw;
        this.count = 0;
        this.height = parseFloat(getComputedStyle(pane).lineHeight);
        this.first = 0; // of the rows in the document
        this.end = 0;
        pane.addEventListener('scroll', () => this.update());
        new ResizeObserver(() => this.update()).observe(pane);
    }

    // Takes all rows away; `show` brings the new ones.
    setCount(count) {
        this.count = count;
        this.body.style.height = `${count * this.height}px`;
        this.fill(0, 0);
    }

    get visibleHeight() {
        return this.pane.clientHeight - (this.head ? this.head.offsetHeight : 0);
    }

    get pageRows() {
        return Math.max(1, Math.floor(this.visibleHeight / this.height) - 1);
    }

    // Scrolling by less than a row changes none.
    update() {
        if (this.isPrinting) {
            return;
        }
        const first = Math.max(0, Math.floor(this.pane.scrollTop / this.height) - spareRows);
        const end = Math.min(this.count, first + Math.ceil(this.visibleHeight / this.height) + 2 * spareRows);
        if (first !== this.first || end !== this.end) {
            this.fill(first, end);
        }
    }

    fill(first, end) {
        this.first = first;
        this.end = end;
        const rows = [];
        for (let index = first; index < end; ++index) {
            const row = this.draw(index);
            row.style.top = `${index * this.height}px`;
            rows.push(row);
        }
        this.body.replaceChildren(...rows);
    }

    // Brings a row into sight; one that is far away, into the middle.
    show(index) {
        const top = index * this.height;
        const below = top + this.height - this.visibleHeight;
        const distance = Math.max(this.pane.scrollTop - top, below - this.pane.scrollTop);
        if (distance > this.visibleHeight) {
            this.pane.scrollTop = top - this.visibleHeight / 2;
        } else if (top < this.pane.scrollTop) {
            this.pane.scrollTop = top;
        } else if (below > this.pane.scrollTop) {
            this.pane.scrollTop = below;
        }
        this.first = this.end = 0; // its state may be another one
        this.update();
    }

    // On paper there is nothing to scroll.
    print(most) {
        this.isPrinting = true;
        this.fill(0, Math.min(most, this.count));
    }

    endPrint() {
        this.isPrinting = false;
        this.update();
    }
}

// Where a key leads to from a row, or nothing where it is none of those that move.
function rowAfter(key, index, count, pageRows) {
    const steps = { ArrowDown: 1, ArrowUp: -1, PageDown: pageRows, PageUp: -pageRows, Home: -count, End: count };
    return key in steps && count > 0 ? Math.min(count - 1, Math.max(0, index + steps[key])) : undefined;
}

// An element with text, which never becomes markup.
function element(name, attributes, text = '') {
    const made = document.createElement(name);
    for (const [attribute, value] of Object.entries(attributes)) {
        made.setAttribute(attribute, value);
    }
    made.textContent = text;
    return made;
}

function setActive(pane, id) {
    if (document.getElementById(id)) {
        pane.setAttribute('aria-activedescendant', id);
    } else {
        pane.removeAttribute('aria-activedescendant');
    }
}
