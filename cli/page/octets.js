// SPDX-License-Identifier: MIT
// The octets of the chosen packet in hexadecimal and as ASCII, and the bits of the chosen field.

const lineOctets = 16;
const mostBitOctets = 8; // shown as bits

class OctetView {
    // `chosen` is called with the first bit of an octet and the number of bits that were pointed at.
    constructor(pane, bits, chosen) {
        this.pane = pane;
        this.bits = bits;
        this.chosen = chosen;
        this.octets = new Uint8Array();
        this.ipOctet = 0;
        this.ranges = []; // lit
        this.cursor = 0;
        this.rows = new Rows(pane, index => this.line(index));
        pane.addEventListener('keydown', event => this.key(event));
        pane.addEventListener('scroll', () => setActive(pane, `octet-${this.cursor}`));
        pane.addEventListener('click', event => {
            const cell = event.target.closest('[data-octet]');
            if (cell) {
                this.move(Number(cell.dataset.octet));
            }
        });
        bits.addEventListener('click', event => {
            if (event.target.dataset.bit) {
                this.chosen(Number(event.target.dataset.bit), 1);
            }
        });
    }

    show(octets, ipOctet) {
        this.octets = octets;
        this.ipOctet = ipOctet;
        this.ranges = [];
        this.cursor = 0;
        this.pane.setAttribute('aria-rowcount', Math.ceil(octets.length / lineOctets));
        this.rows.setCount(Math.ceil(octets.length / lineOctets));
        this.pane.scrollTop = 0;
    }

    firstBit(octet) {
        return (octet - this.ipOctet) * 8 + 1;
    }

    // Lights bits. The cursor goes to the first one unless it is among them already.
    light(ranges) {
        this.ranges = ranges;
        if (ranges.length > 0 && bitsIn(ranges, this.firstBit(this.cursor)) === 0) {
            this.cursor = Math.min(this.octets.length - 1, this.firstOctet());
        }
        this.rows.show(Math.floor(this.cursor / lineOctets));
        setActive(this.pane, `octet-${this.cursor}`);
        this.showBits();
    }

    // The first one that is lit.
    firstOctet() {
        return this.ipOctet + Math.floor((Math.min(...this.ranges.map(range => range.first)) - 1) / 8);
    }

    classOf(octet) {
        const bits = bitsIn(this.ranges, this.firstBit(octet));
        const lit = bits === 0 ? '' : bits === 8 ? 'lit' : 'part';
        return `${lit} ${octet < this.ipOctet ? 'link' : ''} ${octet === this.cursor ? 'active' : ''}`;
    }

    line(index) {
        const start = index * lineOctets;
        const line = element('div', { role: 'row', class: 'line', 'aria-rowindex': index + 1 });
        line.append(element('span', { role: 'rowheader', class: 'offset' }, hex(start, 4)));
        const text = element('span', { class: 'text', 'aria-hidden': true });
        for (let octet = start; octet < start + lineOctets; ++octet) {
            if (octet >= this.octets.length) {
                line.append(element('span', { class: 'octet', role: 'none' }));
                continue;
            }
            const value = this.octets[octet];
            const state = this.classOf(octet);
            line.append(element('span', {
                role: 'gridcell', id: `octet-${octet}`, 'data-octet': octet, class: `octet ${state}`,
                'aria-selected': /lit|part/.test(state),
            }, hex(value, 2)));
            text.append(element('span', { 'data-octet': octet, class: state },
                value >= 0x20 && value < 0x7f ? String.fromCharCode(value) : '.'));
        }
        line.append(text);
        return line;
    }

    move(octet) {
        this.cursor = octet;
        this.chosen(this.firstBit(octet), 8);
    }

    key(event) {
        const lines = { ArrowUp: -1, ArrowDown: 1, PageUp: -this.rows.pageRows, PageDown: this.rows.pageRows };
        const last = this.octets.length - 1;
        const lineStart = this.cursor - this.cursor % lineOctets;
        let octet;
        switch (event.key) {
        case 'ArrowLeft': octet = this.cursor - 1; break;
        case 'ArrowRight': octet = this.cursor + 1; break;
        case 'Home': octet = event.ctrlKey ? 0 : lineStart; break;
        case 'End': octet = event.ctrlKey ? last : lineStart + lineOctets - 1; break;
        case 'Enter': octet = this.cursor; break;
        default:
            if (!(event.key in lines)) {
                return;
            }
            octet = this.cursor + lines[event.key] * lineOctets;
        }
        event.preventDefault();
        if (last >= 0) {
            this.move(Math.max(0, Math.min(last, octet)));
        }
    }

    // The first lit octets as bits, the most significant one on the left.
    showBits() {
        const groups = [];
        const first = this.ranges.length === 0 ? this.octets.length : this.firstOctet();
        for (let octet = first; octet < this.octets.length && groups.length < mostBitOctets; ++octet) {
            if (bitsIn(this.ranges, this.firstBit(octet)) === 0) {
                break;
            }
            const group = element('div', {});
            group.append(element('div', { class: 'offset' }, hex(octet, 4)));
            for (let bit = 7; bit >= 0; --bit) {
                const number = this.firstBit(octet) + bit;
                group.append(element('span', {
                    class: `digit ${hasBit(this.ranges, number) ? 'lit' : ''}`, 'data-bit': number,
                }, this.octets[octet] >> bit & 1));
            }
            groups.push(group);
        }
        this.bits.replaceChildren(...groups);
    }
}

function hex(number, digits) {
    return number.toString(16).padStart(digits, '0');
}
