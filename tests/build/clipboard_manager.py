#!/usr/bin/env python3
"""The smallest clipboard manager: saves what a program that ends asks it to, and serves that.
Prints a line when it is ready. Increments are taken, and given as one property."""

from Xlib import X, Xatom, display
from Xlib.protocol import event

DISPLAY = display.Display()
PIECE = 1 << 16
WINDOW = DISPLAY.screen().root.create_window(0, 0, 1, 1, 0, X.CopyFromParent)
WINDOW.change_attributes(event_mask=X.PropertyChangeMask)


def atom(name):
    return DISPLAY.intern_atom(name)


def wait(matches):
    while True:
        happened = DISPLAY.next_event()
        if matches(happened):
            return happened


def take_property():
    value = WINDOW.get_full_property(atom("SAVED"), X.AnyPropertyType)
    WINDOW.delete_property(atom("SAVED"))
    DISPLAY.flush()
    return value


def fetch(target):
    """The bytes of a target of the present owner."""
    WINDOW.convert_selection(atom("CLIPBOARD"), target, atom("SAVED"), X.CurrentTime)
    wait(lambda e: e.type == X.SelectionNotify and e.target == target)
    value = take_property()
    if value.property_type != atom("INCR"):
        return bytes(value.value)
    parts = []
    while not parts or parts[-1]:
        wait(lambda e: e.type == X.PropertyNotify and e.state == X.PropertyNewValue)
        parts.append(bytes(take_property().value))
    return b"".join(parts)


def answer(request, done):
    request.requestor.send_event(event.SelectionNotify(
        time=request.time, requestor=request.requestor, selection=request.selection,
        target=request.target, property=request.property if done else X.NONE))
    DISPLAY.flush()


def save(request):
    """What a program that ends wants kept, by its list."""
    wanted = request.requestor.get_full_property(request.property, Xatom.ATOM).value
    saved = {target: fetch(target) for target in wanted}
    WINDOW.set_selection_owner(atom("CLIPBOARD"), X.CurrentTime)
    answer(request, True)
    return saved


def serve(request, saved):
    if request.target == atom("TARGETS"):
        request.requestor.change_property(request.property, Xatom.ATOM, 32, list(saved))
    elif request.target in saved:
        value = saved[request.target]
        for start in range(0, len(value), PIECE):  # a request has its limit
            request.requestor.change_property(request.property, request.target, 8,
                                              value[start:start + PIECE], mode=X.PropModeAppend)
    answer(request, request.target == atom("TARGETS") or request.target in saved)


def main():
    WINDOW.set_selection_owner(atom("CLIPBOARD_MANAGER"), X.CurrentTime)
    DISPLAY.sync()
    print("ready", flush=True)
    saved = {}
    while True:
        request = wait(lambda e: e.type == X.SelectionRequest)
        if request.selection == atom("CLIPBOARD_MANAGER"):
            saved = save(request)
        else:
            serve(request, saved)


main()
