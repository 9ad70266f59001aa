"""A GTK window with a password field, which has the focus first, a field that shows what is typed, and a button. Prints
where each of them is on the screen once it is shown: "field NAME X Y WIDTH HEIGHT"."""

import gi

gi.require_version("Gtk", "3.0")
from gi.repository import GLib, Gtk  # noqa: E402


def tell(window, fields):
    for name, field in fields.items():
        _, left, top = window.get_window().get_origin()
        x, y = field.translate_coordinates(window, 0, 0)
        area = field.get_allocation()
        print("field", name, left + x, top + y, area.width, area.height, flush=True)


def main():
    window = Gtk.Window(title="Form")
    window.set_default_size(400, 300)
    window.connect("destroy", Gtk.main_quit)
    box = Gtk.Box(orientation=Gtk.Orientation.VERTICAL, spacing=20)
    fields = {"password": Gtk.Entry(visibility=False, input_purpose=Gtk.InputPurpose.PASSWORD), "open": Gtk.Entry(),
              "button": Gtk.Button(label="Send", can_focus=False)}
    for field in fields.values():
        box.pack_start(field, False, False, 0)
    window.add(box)
    window.show_all()
    fields["password"].grab_focus()
    GLib.timeout_add(500, tell, window, fields)
    Gtk.main()


if __name__ == "__main__":
    main()
