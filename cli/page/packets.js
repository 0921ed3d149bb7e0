// SPDX-License-Identifier: MIT
// The list of packets, and its filter.

const allColumns = [
    { name: 'File', key: 'file', most: 24 },
    { name: 'No.', key: 'number', right: true, most: 10 },
    { name: 'Time', key: 'time', right: true, most: 30 },
    { name: 'Source', key: 'source', most: 30 },
    { name: 'Destination', key: 'destination', most: 30 },
    { name: 'Protocol', key: 'protocol', most: 12 },
    { name: 'Length', key: 'length', right: true, most: 8 },
    { name: 'Check', key: 'state', most: 8 },
    { name: 'Summary', key: 'summary' },
];

class PacketList {
    // `chosen` is called with the packet that was chosen.
    constructor(pane, packets, chosen) {
        this.pane = pane;
        this.packets = packets;
        this.shown = packets;
        this.index = -1;
        this.wanted = null; // the packet that was chosen last, also while the filter leaves it out
        this.chosen = chosen;
        const columns = allColumns.filter(({ key }) => key !== 'file' || packets.some(packet => packet.file !== ''));
        this.columns = columns;
        pane.style.setProperty('--columns', columnWidths(columns, packets));
        const head = pane.querySelector('.head .row');
        columns.forEach(column => head.append(
            element('span', { role: 'columnheader', class: column.right ? 'right' : '' }, column.name)));
        this.rows = new Rows(pane, index => this.row(index));
        pane.addEventListener('keydown', event => this.key(event));
        pane.addEventListener('click', event => {
            const row = event.target.closest('.rows .row');
            if (row) {
                this.choose(Number(row.dataset.index));
            }
        });
        pane.addEventListener('scroll', () => setActive(pane, `packet-${this.index}`));
        this.setShown(packets);
    }

    row(index) {
        const packet = this.shown[index];
        const row = element('div', {
            role: 'row', id: `packet-${index}`, 'data-index': index, 'aria-rowindex': index + 2,
            'aria-selected': index === this.index,
            class: `row ${index === this.index ? 'active' : ''} ${packet.state === 'DAMAGED' ? 'damaged' : ''}` +
                `${packet.source === '' ? 'other' : ''}`,
        });
        for (const { key, right } of this.columns) {
            const cell = element('span', { role: 'gridcell', class: `${key} ${right ? 'right' : ''}` }, packet[key]);
            cell.title = packet[key];
            row.append(cell);
        }
        return row;
    }

    setShown(packets) {
        this.shown = packets;
        this.pane.setAttribute('aria-rowcount', packets.length + 1);
        this.rows.setCount(packets.length);
    }

    // Shows the packets that have all words, and none of those after '!'.
    filter(text) {
        const words = text.toLowerCase().split(/\s+/).filter(word => word !== '' && word !== '!');
        const fits = packet => words.every(word =>
            word[0] === '!' ? !packet.searched.includes(word.slice(1)) : packet.searched.includes(word));
        this.index = -1;
        this.setShown(words.length === 0 ? this.packets : this.packets.filter(fits));
        if (this.shown.length > 0) {
            this.open(Math.max(0, this.shown.indexOf(this.wanted)));
        }
    }

    choose(index) {
        this.wanted = this.shown[index];
        this.open(index);
    }

    open(index) {
        this.index = index;
        this.rows.show(index);
        setActive(this.pane, `packet-${index}`);
        this.chosen(this.shown[index]);
    }

    key(event) {
        const index = rowAfter(event.key, this.index, this.shown.length, this.rows.pageRows);
        if (index !== undefined) {
            event.preventDefault();
            this.choose(index);
        }
    }
}

// As wide as the widest text, so that the rest is left for the last column.
function columnWidths(columns, packets) {
    const widths = columns.map(column => column.name.length);
    for (const packet of packets) {
        columns.forEach(({ key }, i) => { widths[i] = Math.max(widths[i], String(packet[key]).length); });
    }
    return columns.map(({ most }, i) => (most ? `${Math.min(most, widths[i])}ch` : 'minmax(0, 1fr)')).join(' ');
}
