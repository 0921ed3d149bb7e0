// SPDX-License-Identifier: MIT
#include "netfloor-host/condition.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <limits>
#include <optional>
#include <utility>

#include "address_parser.h"

namespace netfloor {
namespace {

constexpr std::uint32_t most = std::numeric_limits<std::uint32_t>::max();

constexpr std::array<std::pair<std::string_view, LayerKind>, layerKinds> layerNames = {{
    {"ip", LayerKind::ip},
    {"gre", LayerKind::gre},
    {"icmp", LayerKind::icmp},
    {"icmpv6", LayerKind::icmpv6},
    {"quoted", LayerKind::quoted},
    {"tcp", LayerKind::tcp},
    {"udp", LayerKind::udp},
    {"sctp", LayerKind::sctp},
    {"chunk", LayerKind::chunk},
    {"security", LayerKind::security},
    {"payload", LayerKind::payload},
}};

// How many letters change one name into the other.
std::size_t distance(std::string_view left, std::string_view right) {
    std::vector<std::size_t> row(right.size() + 1);
    for (std::size_t column = 0; column < row.size(); ++column) {
        row[column] = column;
    }
    for (std::size_t line = 0; line < left.size(); ++line) {
        std::size_t diagonal = std::exchange(row[0], line + 1);
        for (std::size_t column = 1; column < row.size(); ++column) {
            const std::size_t changed = diagonal + (left[line] == right[column - 1] ? 0 : 1);
            diagonal = row[column];
            row[column] = std::min({changed, row[column] + 1, row[column - 1] + 1});
        }
    }
    return row.back();
}

std::string_view nearestName(std::string_view wrong) {
    std::string_view nearest;
    std::size_t least = std::max<std::size_t>(2, wrong.size() / 3) + 1;
    const auto consider = [&](std::string_view name) {
        const std::size_t letters = distance(wrong, name);
        if (letters < least) {
            least = letters;
            nearest = name;
        }
    };
    for (const LayerFieldSource &row : layerFieldSources()) {
        consider(row.name);
    }
    for (const JointField &joint : jointFields) {
        consider(joint.name);
    }
    for (const auto &[name, kind] : layerNames) {
        consider(name);
    }
    return nearest;
}

struct Word {
    std::string_view text; // empty: the end
    std::size_t place = 0;
};

} // namespace

// Reads a condition from left to right.
class ConditionParser {
public:
    ConditionParser(Condition &condition, std::string_view text) : condition_(condition), text_(text) { advance(); }

    std::size_t parse() {
        const std::size_t root = parseAny();
        if (!word_.text.empty()) {
            fail("'" + std::string(word_.text) + "' cannot stand here: 'and' or 'or' joins two terms");
        }
        return root;
    }

private:
    using Operation = Condition::Operation;
    using Term = Condition::Term;

    // A parenthesis or a 'not' inside another one takes native stack.
    static constexpr std::size_t mostNesting = 64;

    [[noreturn]] void fail(const std::string &sentence) const {
        throw ConditionError(sentence, word_.place, std::max<std::size_t>(1, word_.text.size()));
    }

    // Takes the next word: a run of letters, digits and what addresses have, or an operator.
    void advance() {
        while (end_ < text_.size() && std::isspace(static_cast<unsigned char>(text_[end_])) != 0) {
            ++end_;
        }
        word_ = {{}, end_};
        if (end_ == text_.size()) {
            return;
        }
        const auto isPlain = [](char c) {
            return std::isalnum(static_cast<unsigned char>(c)) != 0 || c == '_' || c == '.' || c == ':' || c == '/';
        };
        while (end_ < text_.size() && isPlain(text_[end_])) {
            ++end_;
        }
        if (end_ == word_.place) {
            constexpr std::array<std::string_view, 6> pairs = {"==", "!=", "<=", ">=", "&&", "||"};
            const bool isPair = std::ranges::find(pairs, text_.substr(end_, 2)) != pairs.end();
            end_ += isPair ? 2 : 1;
        }
        word_.text = text_.substr(word_.place, end_ - word_.place);
    }

    bool take(std::string_view word, std::string_view other = {}) {
        if (word_.text.empty() || (word_.text != word && word_.text != other)) {
            return false;
        }
        advance();
        return true;
    }

    std::size_t add(Operation operation, std::vector<std::size_t> parts) {
        condition_.nodes_.push_back({operation, std::move(parts)});
        return condition_.nodes_.size() - 1;
    }

    std::size_t parseAny() {
        std::vector<std::size_t> parts = {parseAll()};
        while (take("or", "||")) {
            parts.push_back(parseAll());
        }
        return parts.size() == 1 ? parts.front() : add(Operation::any, std::move(parts));
    }

    std::size_t parseAll() {
        std::vector<std::size_t> parts = {parseOne()};
        while (take("and", "&&")) {
            parts.push_back(parseOne());
        }
        return parts.size() == 1 ? parts.front() : add(Operation::all, std::move(parts));
    }

    std::size_t parseOne() {
        if (++nesting_ > mostNesting) {
            fail("more than 64 parentheses and 'not' stand inside each other");
        }
        std::size_t node = 0;
        if (take("not", "!")) {
            node = add(Operation::none, {parseOne()});
        } else if (take("(")) {
            node = parseAny();
            if (!take(")")) {
                fail("a ')' is missing");
            }
        } else {
            Term term = parseTerm();
            condition_.terms_.push_back(std::move(term));
            node = add(Operation::term, {condition_.terms_.size() - 1});
        }
        --nesting_;
        return node;
    }

    Term parseTerm() {
        if (word_.text.empty()) {
            fail("a field is missing here, such as 'ip.ttl'");
        }
        Term term;
        const bool isLayer = parseName(term);
        if (isLayer) {
            return term;
        }
        isAddress_ = std::ranges::any_of(layerFieldSources(), [&](const LayerFieldSource &row) {
            return findLayerField(row.name) == term.fields.front() &&
                   (row.value == LayerValue::ipv4Address || row.value == LayerValue::ipv6Address);
        });
        isNumber_ = !isAddress_ && std::ranges::none_of(layerFieldSources(), [&](const LayerFieldSource &row) {
            return row.value == LayerValue::octets && findLayerField(row.name) == term.fields.front();
        });
        parseComparison(term);
        return term;
    }

    // The field or layer that a term starts with. Gives whether it is a layer.
    bool parseName(Term &term) {
        const std::string_view name = word_.text;
        const auto *const layer = std::ranges::find(layerNames, name, &std::pair<std::string_view, LayerKind>::first);
        const auto *const joint = std::ranges::find(jointFields, name, &JointField::name);
        const std::optional<LayerField> field = findLayerField(name);
        if (layer != layerNames.end()) {
            term.kind = layer->second;
        } else if (joint != jointFields.end()) {
            term.fields.assign(joint->fields.begin(), joint->fields.end());
        } else if (field) {
            term.fields = {*field};
        } else {
            const std::string_view nearest = nearestName(name);
            fail("'" + std::string(name) + "' is no field" +
                 (nearest.empty() ? std::string() : "; did you mean '" + std::string(nearest) + "'?"));
        }
        if (!term.fields.empty()) {
            term.kind = term.fields.front().kind;
        }
        advance();
        return term.fields.empty();
    }

    void parseComparison(Term &term) {
        const Word comparison = word_;
        if (take("==", "eq") || take("=")) {
            parseValue(term);
        } else if (take("!=", "ne")) {
            term.isNot = true;
            parseValue(term);
        } else if (take("in")) {
            parseSet(term);
        } else if (take("<", "lt")) {
            const std::uint32_t number = parseOrderedNumber(comparison);
            term.ranges = number == 0 ? std::vector<Condition::Range>() : std::vector{Condition::Range{0, number - 1}};
        } else if (take("<=", "le")) {
            term.ranges = {{0, parseOrderedNumber(comparison)}};
        } else if (take(">", "gt")) {
            const std::uint32_t number = parseOrderedNumber(comparison);
            term.ranges =
                number == most ? std::vector<Condition::Range>() : std::vector{Condition::Range{number + 1, most}};
        } else if (take(">=", "ge")) {
            term.ranges = {{parseOrderedNumber(comparison), most}};
        } else {
            // Alone, a flag is asked whether it is set, and any other number is not 0.
            term.asksForValue = isNumber_;
            term.ranges = {{1, most}};
            return;
        }
        term.asksForValue = true;
    }

    std::uint32_t parseOrderedNumber(const Word &comparison) {
        if (isAddress_) {
            word_ = comparison;
            fail("addresses have no order: compare them by '==' or '!=', or by 'in' with a prefix");
        }
        return parseNumber();
    }

    void parseSet(Term &term) {
        if (!take("{")) {
            return parseValue(term);
        }
        do {
            parseValue(term);
        } while (take(","));
        if (!take("}")) {
            fail("a ',' or a '}' is missing");
        }
    }

    void parseValue(Term &term) {
        if (isAddress_) {
            term.prefixes.push_back(parsePrefix());
            return;
        }
        const std::uint32_t first = parseNumber();
        const Word lastWord = word_;
        const std::uint32_t last = take("-") ? parseNumber() : first;
        if (last < first) {
            word_ = lastWord;
            fail("this range ends before it starts");
        }
        term.ranges.push_back({first, last});
    }

    std::uint32_t parseNumber() {
        if (!isNumber_) {
            fail("the octets of this field have no value to compare; without a comparison the term asks whether it is "
                 "there");
        }
        const bool isHexadecimal = word_.text.starts_with("0x");
        const std::string_view digits = word_.text.substr(isHexadecimal ? 2 : 0);
        std::uint32_t number = 0;
        const auto [end, error] =
            std::from_chars(digits.data(), digits.data() + digits.size(), number, isHexadecimal ? 16 : 10);
        if (error == std::errc::result_out_of_range) {
            fail("a number is at most 4294967295");
        }
        if (digits.empty() || error != std::errc() || end != digits.data() + digits.size()) {
            fail(word_.text.empty() ? "a number is missing here"
                                    : "'" + std::string(word_.text) + "' is no number, and this field is one");
        }
        advance();
        return number;
    }

    Condition::Prefix parsePrefix() {
        const std::string_view text = word_.text;
        const std::size_t slash = std::min(text.find('/'), text.size());
        const std::string_view address = text.substr(0, slash);
        Condition::Prefix prefix;
        if (parseIpv4(address, std::span(prefix.octets).first<4>())) {
            prefix.octetCount = 4;
        } else if (parseIpv6(address, prefix.octets)) {
            prefix.octetCount = 16;
        } else {
            fail(text.empty() ? "an address is missing here"
                              : "'" + std::string(text) + "' is no IPv4 or IPv6 address, and this field is one");
        }
        const std::uint32_t mostBits = prefix.octetCount * bitsPerOctet;
        std::uint32_t bits = mostBits;
        if (slash != text.size()) {
            const std::string_view digits = text.substr(slash + 1);
            const auto [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), bits);
            if (digits.empty() || error != std::errc() || end != digits.data() + digits.size() || bits > mostBits) {
                fail("the length of this prefix is no number from 0 to " + std::to_string(mostBits));
            }
        }
        prefix.bits = static_cast<std::uint8_t>(bits);
        advance();
        return prefix;
    }

    Condition &condition_;
    std::string_view text_;
    std::size_t end_ = 0; // of the current word
    Word word_;
    std::size_t nesting_ = 0;
    bool isAddress_ = false; // the field of the current term
    bool isNumber_ = false;
};

Condition::Condition(std::string_view text) {
    root_ = ConditionParser(*this, text).parse();
}

bool Condition::holdsFor(const LayerView &view) const {
    for (std::uint16_t layer = 1; layer <= view.ipLayers(); ++layer) {
        if (holdsFor(view, layer)) {
            return true;
        }
    }
    return false;
}

bool Condition::holdsFor(const LayerView &view, std::uint16_t ipLayer) const {
    bool hasChunks = false;
    for (const Layer &layer : view.layers()) {
        if (layer.kind == LayerKind::chunk && layer.ipLayer == ipLayer) {
            hasChunks = true;
            if (holds(root_, view, ipLayer, &layer)) {
                return true;
            }
        }
    }
    return !hasChunks && holds(root_, view, ipLayer, nullptr);
}

bool Condition::holdsFor(const LayerView &view, std::uint16_t ipLayer, const Layer *chunk) const {
    return holds(root_, view, ipLayer, chunk);
}

bool Condition::holds(std::size_t node, const LayerView &view, std::uint16_t ipLayer, const Layer *chunk) const {
    const auto &[operation, parts] = nodes_[node];
    const auto part = [&](std::size_t place) { return holds(place, view, ipLayer, chunk); };
    switch (operation) {
    case Operation::any: return std::ranges::any_of(parts, part);
    case Operation::all: return std::ranges::all_of(parts, part);
    case Operation::none: return std::ranges::none_of(parts, part);
    case Operation::term: break;
    }
    const Term &term = terms_[parts.front()];
    if (term.kind == LayerKind::chunk) {
        return chunk != nullptr && holds(term, view, *chunk);
    }
    return std::ranges::any_of(view.layers(), [&](const Layer &layer) {
        const bool isAsked = layer.kind == term.kind || !term.fields.empty(); // which may be of several kinds
        return isAsked && layer.ipLayer == ipLayer && holds(term, view, layer);
    });
}

bool Condition::holds(const Term &term, const LayerView &view, const Layer &layer) {
    if (term.fields.empty()) {
        return true;
    }
    bool isPresent = false;
    for (const LayerField field : term.fields) {
        if (view.has(layer, field)) {
            isPresent = true;
            if (!term.asksForValue || isOneOf(term, view, layer, field)) {
                return !term.isNot;
            }
        }
    }
    return term.isNot && isPresent;
}

bool Condition::isOneOf(const Term &term, const LayerView &view, const Layer &layer, LayerField field) {
    const LayerValue kind = view.valueKind(layer, field);
    if (kind != LayerValue::ipv4Address && kind != LayerValue::ipv6Address) {
        const std::uint32_t number = view.number(layer, field).value_or(0);
        return std::ranges::any_of(term.ranges,
                                   [&](const Range &range) { return range.first <= number && number <= range.last; });
    }
    const std::size_t octetCount = kind == LayerValue::ipv4Address ? 4 : 16;
    const auto octets = view.packet().subspan(view.octet(layer, field), octetCount);
    return std::ranges::any_of(term.prefixes, [&](const Prefix &prefix) {
        if (prefix.octetCount != octetCount) {
            return false;
        }
        const std::size_t whole = prefix.bits / bitsPerOctet;
        const std::uint32_t rest = prefix.bits % bitsPerOctet;
        return std::equal(octets.begin(), octets.begin() + static_cast<std::ptrdiff_t>(whole), prefix.octets.begin()) &&
               (rest == 0 || ((octets[whole] ^ prefix.octets[whole]) >> (bitsPerOctet - rest)) == 0);
    });
}

} // namespace netfloor
