# SPDX-License-Identifier: MIT
"""What can go wrong. Each message is a sentence: what is wrong, where, and what to do."""


class CaptureError(OSError):
    """The file cannot be read as a capture at all."""


class CaptureDamage(CaptureError):
    """The capture ends in the middle of a packet, or the next octets are no packet. All packets before are good.

    packet is the number of the first packet that is lost, position the octet at which its record begins.
    """

    def __init__(self, message: str, packet: int, position: int) -> None:
        super().__init__(message)
        self.packet = packet
        self.position = position

    def __reduce__(self) -> tuple[type["CaptureDamage"], tuple[str, int, int]]:
        return CaptureDamage, (str(self), self.packet, self.position)


class ConditionError(ValueError):
    """The text of a condition has a mistake, place characters from its start and length characters long."""

    def __init__(self, message: str, place: int, length: int) -> None:
        super().__init__(message)
        self.place = place
        self.length = length

    def __reduce__(self) -> tuple[type["ConditionError"], tuple[str, int, int]]:
        return ConditionError, (str(self), self.place, self.length)


class PluginError(RuntimeError):
    """The plug-in of the package is missing or damaged. Install the package again."""
