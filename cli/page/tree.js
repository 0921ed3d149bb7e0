// SPDX-License-Identifier: MIT
// The blocks and fields of the chosen packet.

class FieldTree {
    // `chosen` is called with the item that was chosen; `entered` when Enter leads on from a field.
    constructor(pane, chosen, entered) {
        this.pane = pane;
        this.chosen = chosen;
        this.entered = entered;
        this.items = [];
        this.shown = [];
        this.index = -1;
        this.rows = new Rows(pane, index => this.row(index));
        pane.addEventListener('keydown', event => this.key(event));
        pane.addEventListener('click', event => this.click(event));
        pane.addEventListener('scroll', () => setActive(pane, `item-${this.index}`));
    }

    get item() {
        return this.shown[this.index];
    }

    // Shows another packet. The same field is chosen again if the packet has it.
    show(items) {
        const before = this.item;
        this.items = items;
        linkItems(items);
        this.index = -1;
        this.pane.scrollTop = 0;
        this.update();
        const same = before && items.find(item => item.label === before.label && item.kind === before.kind &&
            item.parent?.label === before.parent?.label && item.position === before.position);
        this.choose(same ?? items[0]);
    }

    update() {
        this.shown = this.items.filter(item => !item.isInClosed);
        this.rows.setCount(this.shown.length);
    }

    row(index) {
        const item = this.shown[index];
        const attributes = {
            role: 'treeitem', id: `item-${index}`, 'data-index': index, class: `item ${item.kind}`,
            'aria-level': item.depth + 1, 'aria-posinset': item.position, 'aria-setsize': item.siblings.length,
            'aria-selected': index === this.index,
        };
        if (item.children.length > 0) {
            attributes['aria-expanded'] = !item.isClosed;
        }
        const row = element('div', attributes);
        row.classList.toggle('active', index === this.index);
        row.style.paddingLeft = `${8 + item.depth * 14}px`;
        row.append(element('span', { class: 'twisty', 'aria-hidden': true },
            item.children.length === 0 ? '' : item.isClosed ? '+' : '-'));
        row.append(element('span', { class: 'label' }, item.value === '' ? item.label : `${item.label}: `));
        row.append(element('span', { class: 'value', title: item.value }, item.value));
        return row;
    }

    // Chooses an item, in opened blocks.
    choose(item) {
        if (!item) {
            return;
        }
        if (item.isInClosed) {
            for (let parent = item.parent; parent; parent = parent.parent) {
                parent.isClosed = false;
            }
            this.markClosed();
        }
        this.index = this.shown.indexOf(item);
        this.rows.show(this.index);
        setActive(this.pane, `item-${this.index}`);
        this.chosen(item);
    }

    toggle(item, isClosed) {
        item.isClosed = isClosed;
        this.markClosed();
        this.choose(item);
    }

    markClosed() {
        for (const item of this.items) {
            item.isInClosed = Boolean(item.parent && (item.parent.isClosed || item.parent.isInClosed));
        }
        this.update();
    }

    click(event) {
        const row = event.target.closest('.item');
        if (!row) {
            return;
        }
        const item = this.shown[Number(row.dataset.index)];
        if (event.target.closest('.twisty') && item.children.length > 0) {
            this.toggle(item, !item.isClosed);
        } else {
            this.choose(item);
        }
    }

    key(event) {
        const index = rowAfter(event.key, this.index, this.shown.length, this.rows.pageRows);
        if (index !== undefined) {
            this.choose(this.shown[index]);
        } else if (!this.item || !this.act(event.key, this.item)) {
            return;
        }
        event.preventDefault();
    }

    act(key, item) {
        const isOpen = item.children.length > 0 && !item.isClosed;
        switch (key) {
        case 'ArrowRight':
            isOpen ? this.choose(item.children[0]) : this.toggle(item, false);
            return true;
        case 'ArrowLeft':
            isOpen ? this.toggle(item, true) : this.choose(item.parent);
            return true;
        case 'Enter':
        case ' ':
            item.children.length > 0 ? this.toggle(item, isOpen) : this.entered();
            return true;
        default: return false;
        }
    }
}

// The bits of an item; of a block, those of all that it holds.
function rangesOf(item) {
    const all = item.ranges.length > 0 ? item.ranges : item.children.flatMap(rangesOf);
    const merged = [];
    for (const range of all.toSorted((a, b) => a.first - b.first)) {
        const last = merged.at(-1);
        if (last && range.first <= last.end) {
            last.end = Math.max(last.end, range.end);
        } else {
            merged.push({ ...range });
        }
    }
    return merged;
}

// Items come in the order of the tree with their depths. Gives each its parent, children and place among its siblings.
function linkItems(items) {
    const roots = [];
    const open = [];
    for (const item of items) {
        open.length = Math.min(open.length, item.depth);
        item.parent = open[open.length - 1];
        item.children = [];
        item.siblings = item.parent ? item.parent.children : roots;
        item.siblings.push(item);
        item.position = item.siblings.length;
        open[open.length] = item;
    }
}
