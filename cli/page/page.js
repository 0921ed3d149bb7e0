// SPDX-License-Identifier: MIT
// Joins the panes: what is chosen in one is shown in the others.

const byId = id => document.getElementById(id);
const page = readPage(byId('data').textContent);
const counted = (count, thing) => `${count.toLocaleString('en')} ${thing}${count === 1 ? '' : 's'}`;

const octets = new OctetView(byId('octets'), byId('digits'), chooseByBits);
const tree = new FieldTree(byId('tree'), showItem, () => byId('octets').focus());
const list = new PacketList(byId('packets'), page.packets, packet => {
    octets.show(page.octets(packet), packet.ipOctet);
    tree.show(page.items(packet));
});

function showItem(item) {
    const ranges = rangesOf(item);
    octets.light(ranges);
    showChosen(item.value === '' ? item.label : `${item.label}: ${item.value}`, placeText(ranges));
}

function showChosen(text, place) {
    byId('field').replaceChildren(element('span', { title: text }, text), ' ', element('span', {}, place));
}

// "octets 2 to 3 of the IP packet, bits 17-32"
function placeText(ranges) {
    if (ranges.length === 0) {
        return '';
    }
    const first = Math.floor((Math.min(...ranges.map(range => range.first)) - 1) / 8);
    const last = Math.floor((Math.max(...ranges.map(range => range.end)) - 2) / 8);
    const bits = ranges.map(range => (range.end - range.first === 1 ? range.first : `${range.first}-${range.end - 1}`));
    return `${first === last ? `octet ${first}` : `octets ${first} to ${last}`} of the IP packet, bits ${bits.join(',')}`;
}

// The item of fewest bits that has one of these; of an octet that is chosen again, the next one.
function chooseByBits(firstBit, count) {
    const fits = ({ ranges }) => (count === 1 ? hasBit(ranges, firstBit) : bitsIn(ranges, firstBit) > 0);
    const isFault = item => item.parent?.label === 'Checks';
    const found = tree.items.filter(item => fits(item) && !isFault(item)).sort((a, b) => a.size - b.size);
    if (found.length > 0) {
        tree.choose(found[(found.indexOf(tree.item) + 1) % found.length]);
    } else {
        showNothing(firstBit);
    }
}

function showNothing(firstBit) {
    octets.light([{ first: firstBit, end: firstBit + 8 }]);
    showChosen(firstBit < 1 ? 'in no field: before the IP header' : 'in no field', '');
}

function showCount() {
    const all = page.packets.length;
    const shown = list.shown.length;
    byId('count').textContent = shown === all ? counted(all, 'packet') : `${shown.toLocaleString('en')} of ${counted(all, 'packet')}`;
}

function filterBy(text) {
    byId('filter').value = text;
    list.filter(text);
    showCount();
}

function showHeader() {
    const { files, filter, where } = page.about;
    const file = files?.join(', ');
    document.title = file ? `${file} - netfloor` : 'netfloor';
    byId('file').textContent = file ?? 'netfloor';
    const chosenBy = [filter && `--filter ${filter}`, where && `--where ${where}`].filter(Boolean).join(', ');
    byId('total').textContent = [page.ending?.total, chosenBy].filter(Boolean).join(', by ');
    byId('total').title = byId('total').textContent;
    const damaged = page.packets.filter(packet => packet.state === 'DAMAGED').length;
    byId('damaged').hidden = damaged === 0;
    byId('damaged').textContent = `${damaged.toLocaleString('en')} DAMAGED`;
    const remarks = page.ending ? page.ending.remarks
        : ['The writing of this page was ended early. It has the packets up to there.'];
    byId('remarks').hidden = remarks.length === 0;
    byId('remarks').append(...remarks.map(remark => element('li', {}, remark)));
}

function isTyping(event) {
    return event.target.matches('input, select, textarea') || byId('help').open;
}

byId('filter').addEventListener('input', event => filterBy(event.target.value));
byId('filter').addEventListener('keydown', event => {
    if (event.key === 'Enter' || event.key === 'Escape') {
        event.preventDefault();
        filterBy(event.key === 'Escape' ? '' : event.target.value);
        byId('packets').focus();
    }
});
byId('damaged').addEventListener('click', () => {
    filterBy(byId('filter').value === 'DAMAGED' ? '' : 'DAMAGED');
    byId('packets').focus();
});
byId('packets').addEventListener('keydown', event => {
    if (event.key === 'Enter') {
        byId('tree').focus();
    }
});
byId('keys').addEventListener('click', () => byId('help').showModal());
addEventListener('keydown', event => {
    if (isTyping(event) || event.ctrlKey || event.altKey || event.metaKey) {
        return;
    }
    const actions = { '/': () => byId('filter').focus(), '?': () => byId('help').showModal(), Escape: () => byId('packets').focus() };
    if (event.key in actions) {
        event.preventDefault();
        actions[event.key]();
    }
});

const spareLines = 3; // of the head, and for a scroll bar
makeSplitter(byId('below-packets'), '--list', false, (page.packets.length + spareLines) * list.rows.height);
makeSplitter(byId('beside-tree'), '--fields', true);
makeTheme(byId('theme'));
makePrint(list.rows, [tree.rows, octets.rows]);
showHeader();
showCount();
if (page.packets.length > 0) {
    list.choose(0);
}
byId('packets').focus();
performance.mark('ready');
