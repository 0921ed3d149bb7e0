# SPDX-License-Identifier: MIT
"""Single packets."""

from pathlib import Path

import netfloor
import pytest

from conftest import CAPTURES, write_pcap


def test_fields_have_texts_values_and_bits() -> None:
    packet = next(netfloor.packets(CAPTURES / "sctp-over-ipv6.pcap"))
    fields = {field.name: field for field in packet.fields()}
    port = fields["SCTP Destination Port Number"]
    assert (port.value, port.text, port.bits) == (80, "SCTP Destination Port Number=80", [(337, 352)])
    assert port.path.startswith("Ip Header/IPv6 Header/")
    assert "SCTP - SHUTDOWN (7)" in packet.texts()
    assert (packet.number, packet.length, packet.ip_offset, packet.no_ip) == (1, 74, 14, None)
    assert packet.octets[packet.ip_offset] >> 4 == 6


def test_packets_outlive_their_reader(sctp_capture: Path) -> None:
    packets = list(netfloor.packets(sctp_capture))
    assert [packet.time_ns for packet in packets[:2]] == [1_700_000_000_000_000_000, 1_700_000_000_001_000_001]
    tsns = [field.value for field in packets[999].fields() if field.name == "TSN"]
    assert tsns == [999]


def test_packets_without_ip_are_named(tmp_path: Path) -> None:
    ethernet = 1
    arp = bytes(12) + b"\x08\x06" + bytes(28)
    packet = next(netfloor.packets(write_pcap(tmp_path / "arp.pcap", [arp], ethernet)))
    assert (packet.fields(), packet.texts(), packet.ip_offset, packet.no_ip) == ([], [], None, "ARP")


def test_damage_names_the_file_and_the_packet(cut_capture: Path) -> None:
    numbers = []
    with pytest.raises(netfloor.CaptureDamage, match=str(cut_capture)) as damage:
        for packet in netfloor.packets(cut_capture):
            numbers.append(packet.number)
    assert (numbers[-1], damage.value.packet) == (999, 1000)
