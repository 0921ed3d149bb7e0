// SPDX-License-Identifier: MIT
// The data of the page: lines of a letter and a JSON value, as printers/page_data.h describes them. The rows of the
// list are read at once, and a packet's tree and octets when it is shown.

function readPage(text) {
    const page = { about: {}, labels: [], packets: [], ending: null };
    const piece = { t: [0, 0], o: [0, 0] };
    for (let at = 0, end; (end = text.indexOf('\n', at)) >= 0; at = end + 1) {
        switch (text[at]) {
        case 'f': page.about = JSON.parse(text.slice(at + 1, end)); break;
        case 'n': page.labels.push(JSON.parse(text.slice(at + 1, end))); break;
        case 'p': page.packets.push(packetOf(JSON.parse(text.slice(at + 1, end)), piece)); break;
        case 'e': page.ending = JSON.parse(text.slice(at + 1, end)); break;
        case 't':
        case 'o': piece[text[at]] = [at + 1, end]; break;
        }
    }
    page.items = packet => JSON.parse(text.slice(...packet.tree)).map(item => itemOf(item, page.labels));
    page.octets = packet => octetsOf(JSON.parse(text.slice(...packet.octetText)));
    return page;
}

function packetOf(row, piece) {
    const [number, time, length, protocol, source, destination, summary, state, ipOctet, file = ''] = row;
    return {
        number, time, length, protocol, source, destination, summary, state, ipOctet, file,
        tree: piece.t, octetText: piece.o,
        searched: [number, time, source, destination, protocol, length, state, summary, file].join('\n').toLowerCase(),
    };
}

function itemOf([kindAndDepth, label, value = '', ...bits], labels) {
    const ranges = [];
    for (let i = 0; i < bits.length; i += 2) {
        ranges.push({ first: bits[i], end: bits[i] + bits[i + 1] });
    }
    return {
        kind: ['block', 'field', 'note', 'damage'][kindAndDepth % 4],
        depth: Math.floor(kindAndDepth / 4),
        label: typeof label === 'number' ? labels[label] : label,
        value, ranges,
        size: ranges.reduce((sum, range) => sum + range.end - range.first, 0),
    };
}

function octetsOf(base64) {
    return Uint8Array.from(atob(base64), character => character.charCodeAt(0));
}

// Whether one of the ranges has the bit. Bits count from 1 at the IP header, and from the least significant one of an
// octet.
function hasBit(ranges, bit) {
    return ranges.some(range => bit >= range.first && bit < range.end);
}

// How many bits of the octet that begins with `firstBit` are in ranges, which do not overlap.
function bitsIn(ranges, firstBit) {
    return ranges.reduce((sum, range) =>
        sum + Math.max(0, Math.min(range.end, firstBit + 8) - Math.max(range.first, firstBit)), 0);
}
