#include "X11Host.h"

#include <X11/Xlib.h>
#include <X11/Xutil.h>
#include <X11/keysym.h>
#include <spawn.h>
#include <sys/wait.h>

#include <algorithm>
#include <cstdio>
#include <vector>

#include "editor/DibSurface.h"
#include "editor/EditorFonts.h"
#include "editor/EditorWindow.h"
#include "editor/SkinDraw.h"

extern char** environ;

namespace ulvetta {
namespace {

constexpr Time kDoubleClickMs = 400;

// Virtual-key code of an X key symbol; 0 for keys the editor does not use.
int virtualKey(KeySym k) {
  if (k >= XK_0 && k <= XK_9) return '0' + static_cast<int>(k - XK_0);
  if (k >= XK_KP_0 && k <= XK_KP_9) return 96 + static_cast<int>(k - XK_KP_0);
  switch (k) {
    case XK_BackSpace: return 8;
    case XK_Tab:
    case XK_ISO_Left_Tab: return kKeyTab;
    case XK_Return:
    case XK_KP_Enter: return 13;
    case XK_Escape: return 27;
    case XK_Page_Up:
    case XK_KP_Page_Up: return 33;
    case XK_Page_Down:
    case XK_KP_Page_Down: return 34;
    case XK_End:
    case XK_KP_End: return 35;
    case XK_Home:
    case XK_KP_Home: return 36;
    case XK_Left:
    case XK_KP_Left: return 37;
    case XK_Up:
    case XK_KP_Up: return 38;
    case XK_Right:
    case XK_KP_Right: return 39;
    case XK_Down:
    case XK_KP_Down: return 40;
    case XK_Delete:
    case XK_KP_Delete: return 46;
    case XK_KP_Subtract: return 109;
    case XK_KP_Decimal: return 110;
    case XK_comma: return 188;
    case XK_minus: return 189;
    case XK_period: return 190;
    default: return 0;
  }
}

int modifiersOf(unsigned int state) {
  return ((state & ControlMask) ? kModifierCtrl : 0) | ((state & ShiftMask) ? kModifierShift : 0);
}

// Wraps surface rows as an X image without copying (the image never owns the pixels).
XImage* wrap(Display* d, Visual* v, const DibSurface& s) {
  XImage* image = XCreateImage(d, v, 24, ZPixmap, 0, const_cast<char*>(reinterpret_cast<const char*>(s.pixels())),
                               static_cast<unsigned>(s.width()), static_cast<unsigned>(s.height()), 32, s.stride());
  return image;
}

void release(XImage* image) {
  if (!image) return;
  image->data = nullptr;
  XDestroyImage(image);
}

// One line of the popup menu: a command, a separator or a submenu's heading.
struct MenuLine {
  std::string text;
  int id = 0;
  bool checked = false, enabled = true, separator = false;
  int indent = 0;
};

std::string withoutAmpersands(const std::string& s) {
  std::string out;
  for (char c : s)
    if (c != '&') out += c;
  return out;
}

void flatten(const std::vector<MenuItem>& items, int indent, std::vector<MenuLine>& out) {
  for (const MenuItem& item : items) {
    if (item.text.empty() && item.submenu.empty()) {
      out.push_back({"", 0, false, false, true, indent});
    } else if (!item.submenu.empty() || item.id == 0) {
      out.push_back({withoutAmpersands(item.text), 0, false, false, false, indent});
      if (!item.greyed) flatten(item.submenu, indent + 1, out);
    } else {
      out.push_back({withoutAmpersands(item.text), item.id, item.checked, !item.greyed, false, indent});
    }
  }
}

constexpr int kLineHeight = 14, kSeparatorHeight = 5, kMenuPad = 4;
constexpr SkinColour kMenuBack{222, 222, 222, 255}, kMenuText{32, 32, 32, 255}, kMenuGrey{140, 140, 140, 255},
    kMenuHover{24, 113, 118, 255}, kMenuHoverText{243, 242, 242, 255};

}  // namespace

struct X11Host::X {
  Display* display = nullptr;
  Window window = 0;
  GC gc = nullptr;
  Visual* visual = nullptr;
  Colormap colormap = 0;
  Atom deleteMessage = 0;
  bool gone = false;
  unsigned int lastButton = 0;
  Time lastPressTime = 0;

  ~X() {
    if (!display) return;
    if (gc) XFreeGC(display, gc);
    if (window && !gone) XDestroyWindow(display, window);
    if (colormap) XFreeColormap(display, colormap);
    XCloseDisplay(display);
  }
};

X11Host::X11Host(unsigned long parent, std::string configFolder, std::string presetFolder)
    : x_(std::make_unique<X>()), configFolder_(std::move(configFolder)), presetFolder_(std::move(presetFolder)) {
  X& x = *x_;
  x.display = XOpenDisplay(nullptr);
  if (!x.display) return;
  const int screen = DefaultScreen(x.display);
  XVisualInfo want{};
  want.screen = screen;
  want.depth = 24;
  want.c_class = TrueColor;
  int count = 0;
  XVisualInfo* found = XGetVisualInfo(x.display, VisualScreenMask | VisualDepthMask | VisualClassMask, &want, &count);
  // The back buffer's B, G, R, X bytes are the pixel layout of a 24-bit true-colour visual with red on top.
  if (!found || count == 0 || found->red_mask != 0xFF0000 || found->blue_mask != 0xFF) {
    if (found) XFree(found);
    return;
  }
  x.visual = found->visual;
  XFree(found);
  x.colormap = XCreateColormap(x.display, RootWindow(x.display, screen), x.visual, AllocNone);
  XSetWindowAttributes attributes{};
  attributes.colormap = x.colormap;
  attributes.border_pixel = 0;
  attributes.background_pixel = 0;
  attributes.event_mask = ExposureMask | ButtonPressMask | ButtonReleaseMask | PointerMotionMask | KeyPressMask |
                          FocusChangeMask | StructureNotifyMask;
  const Window owner = parent ? static_cast<Window>(parent) : RootWindow(x.display, screen);
  x.window = XCreateWindow(x.display, owner, 0, 0, kEditorWidth, kEditorHeight, 0, 24, InputOutput, x.visual,
                           CWColormap | CWBorderPixel | CWBackPixel | CWEventMask, &attributes);
  XSizeHints hints{};
  hints.flags = PMinSize | PMaxSize;
  hints.min_width = hints.max_width = kEditorWidth;
  hints.min_height = hints.max_height = kEditorHeight;
  XSetWMNormalHints(x.display, x.window, &hints);
  XStoreName(x.display, x.window, "Ulvetta");
  x.deleteMessage = XInternAtom(x.display, "WM_DELETE_WINDOW", False);
  XSetWMProtocols(x.display, x.window, &x.deleteMessage, 1);
  x.gc = XCreateGC(x.display, x.window, 0, nullptr);
  menuFont_.strip().loadResource(kSmallFontResource);
  menuFont_.setGlyphs(kFontCharacterSet, kSmallFontWidths.data());
  XMapWindow(x.display, x.window);
  XFlush(x.display);
}

X11Host::~X11Host() = default;

bool X11Host::ok() const { return x_->window != 0; }
unsigned long X11Host::window() const { return x_->window; }

void X11Host::show(EditorWindow* editor) {
  editor_ = editor;
  if (!editor) return;
  editor->attach(this);
  editor->setActive(true);
  invalid_ = true;
}

bool X11Host::processEvents() {
  X& x = *x_;
  if (!x.display || x.gone) return false;
  while (XPending(x.display) > 0) {
    XEvent e;
    XNextEvent(x.display, &e);
    if (!editor_) continue;
    switch (e.type) {
      case Expose:
        if (e.xexpose.count == 0) invalid_ = true;
        break;
      case ButtonPress:
      case ButtonRelease:
        button(&e.xbutton, e.type == ButtonPress);
        break;
      case MotionNotify: {
        const unsigned int st = e.xmotion.state;
        const int event = (st & Button1Mask) ? kLeftDrag : (st & Button3Mask) ? kRightDrag : kMove;
        editor_->mouse(e.xmotion.x, e.xmotion.y, event, modifiersOf(st));
        break;
      }
      case KeyPress:
        if (const int vk = virtualKey(XLookupKeysym(&e.xkey, 0))) editor_->keyDown(vk);
        break;
      case FocusIn:
      case FocusOut:
        editor_->focusLost(e.type == FocusOut);
        break;
      case DestroyNotify:
        if (e.xdestroywindow.window == x.window) x.gone = true;
        break;
      case ClientMessage:
        if (static_cast<Atom>(e.xclient.data.l[0]) == x.deleteMessage) XUnmapWindow(x.display, x.window);
        break;
      default:
        break;
    }
  }
  if (invalid_ && editor_ && !x.gone) {
    invalid_ = false;
    editor_->paint(0, 0, kEditorWidth, kEditorHeight);
  }
  return !x.gone;
}

void X11Host::button(const void* event, bool press) {
  const XButtonEvent& e = *static_cast<const XButtonEvent*>(event);
  X& x = *x_;
  // Only the left and right buttons; the wheel and the middle button are not the editor's.
  if (e.button != Button1 && e.button != Button3) return;
  const bool left = e.button == Button1;
  const int mods = modifiersOf(e.state);
  if (!press) {
    editor_->mouse(e.x, e.y, left ? kLeftRelease : kRightRelease, mods);
    return;
  }
  // A press while the other button is held is ignored, so the capture is taken only once.
  if (e.state & (left ? Button3Mask : Button1Mask)) return;
  XSetInputFocus(x.display, x.window, RevertToParent, e.time);
  const bool twice = e.button == x.lastButton && e.time - x.lastPressTime <= kDoubleClickMs;
  x.lastButton = twice ? 0 : e.button;
  x.lastPressTime = e.time;
  const int code = left ? (twice ? kLeftDoubleClick : kLeftPress) : (twice ? kRightDoubleClick : kRightPress);
  editor_->mouse(e.x, e.y, code, mods);
}

void X11Host::present(const DibSurface& surface, int x, int y, int w, int h) {
  if (!x_->display || x_->gone || surface.empty()) return;
  Display* display = x_->display;
  const int left = std::max(x, 0), top = std::max(y, 0);
  const int right = std::min(x + w, surface.width()), bottom = std::min(y + h, surface.height());
  if (right <= left || bottom <= top) return;
  XImage* image = wrap(display, x_->visual, surface);
  if (!image) return;
  XPutImage(display, x_->window, x_->gc, image, left, top, left, top, static_cast<unsigned>(right - left),
            static_cast<unsigned>(bottom - top));
  release(image);
  XFlush(display);
}

void X11Host::messageBox(const std::string& text) { std::fprintf(stderr, "Ulvetta: %s\n", text.c_str()); }

void X11Host::openDocument(const std::string& target) {
  // The desktop's opener, without waiting for it; failures are not reported.
  pid_t pid = 0;
  const char* argv[] = {"xdg-open", target.c_str(), nullptr};
  if (posix_spawnp(&pid, "xdg-open", nullptr, nullptr, const_cast<char* const*>(argv), environ) == 0)
    waitpid(pid, nullptr, WNOHANG);
}

int X11Host::trackMenu(const std::vector<MenuItem>& items, int x, int y) {
  if (!x_->display || x_->gone) return 0;
  Display* display = x_->display;
  Visual* visual = x_->visual;
  GC gc = x_->gc;
  const Window editorWindow = x_->window;
  std::vector<MenuLine> lines;
  flatten(items, 0, lines);
  int width = 0, height = 2 * kMenuPad;
  for (const MenuLine& l : lines) {
    width = std::max(width, menuFont_.textWidth(l.text) + 12 * l.indent);
    height += l.separator ? kSeparatorHeight : kLineHeight;
  }
  width += 2 * kMenuPad + 20;
  int rootX = 0, rootY = 0;
  Window child = 0;
  XTranslateCoordinates(display, editorWindow, DefaultRootWindow(display), x - width / 2, y, &rootX, &rootY, &child);

  XSetWindowAttributes attributes{};
  attributes.override_redirect = True;
  attributes.colormap = x_->colormap;
  attributes.border_pixel = 0;
  attributes.event_mask = ExposureMask | ButtonPressMask | ButtonReleaseMask | PointerMotionMask | KeyPressMask;
  const Window popup = XCreateWindow(display, DefaultRootWindow(display), rootX, rootY, static_cast<unsigned>(width),
                                     static_cast<unsigned>(height), 0, 24, InputOutput, visual,
                                     CWOverrideRedirect | CWColormap | CWBorderPixel | CWEventMask, &attributes);
  XMapRaised(display, popup);
  DibSurface surface;
  surface.create(0, 0, width, height);
  int hover = -1;
  auto lineAt = [&](int py) {
    int top = kMenuPad;
    for (size_t i = 0; i < lines.size(); ++i) {
      const int h = lines[i].separator ? kSeparatorHeight : kLineHeight;
      if (py >= top && py < top + h) return lines[i].separator || !lines[i].enabled || !lines[i].id ? -1 : int(i);
      top += h;
    }
    return -1;
  };
  auto draw = [&] {
    fillRect(&surface, 0, 0, width, height, kMenuBack);
    int top = kMenuPad;
    for (size_t i = 0; i < lines.size(); ++i) {
      const MenuLine& l = lines[i];
      if (l.separator) {
        fillRect(&surface, kMenuPad, top + 2, width - 2 * kMenuPad, 1, kMenuGrey);
        top += kSeparatorHeight;
        continue;
      }
      const bool lit = static_cast<int>(i) == hover;
      if (lit) fillRect(&surface, 0, top, width, kLineHeight, kMenuHover);
      const SkinColour c = lit ? kMenuHoverText : l.enabled ? kMenuText : kMenuGrey;
      if (l.checked) fillRect(&surface, kMenuPad + 2, top + 5, 5, 5, c);
      drawText(&surface, menuFont_, 0, 0, width, height, kTextLeft, kMenuPad + 14 + 12 * l.indent, top + 3, l.text, c,
               255);
      top += kLineHeight;
    }
    XImage* image = wrap(display, visual, surface);
    if (image) {
      XPutImage(display, popup, gc, image, 0, 0, 0, 0, static_cast<unsigned>(width), static_cast<unsigned>(height));
      release(image);
    }
    XFlush(display);
  };
  XGrabPointer(display, popup, False, ButtonPressMask | ButtonReleaseMask | PointerMotionMask, GrabModeAsync,
               GrabModeAsync, None, None, CurrentTime);
  XGrabKeyboard(display, popup, False, GrabModeAsync, GrabModeAsync, CurrentTime);
  int chosen = 0;
  bool done = false, sawRelease = false;
  draw();
  while (!done) {
    XEvent e;
    XNextEvent(display, &e);
    if (e.xany.window != popup) {
      if (e.type == Expose) invalid_ = true;
      continue;
    }
    switch (e.type) {
      case Expose:
        draw();
        break;
      case MotionNotify: {
        const bool inside = e.xmotion.x >= 0 && e.xmotion.x < width;
        const int h = inside ? lineAt(e.xmotion.y) : -1;
        if (h != hover) {
          hover = h;
          draw();
        }
        break;
      }
      case ButtonPress:
      case ButtonRelease: {
        const bool inside = e.xbutton.x >= 0 && e.xbutton.x < width && e.xbutton.y >= 0 && e.xbutton.y < height;
        // The release of the right press that opened the menu only arms it.
        if (e.type == ButtonRelease && !sawRelease && !inside) {
          sawRelease = true;
          break;
        }
        const int line = inside ? lineAt(e.xbutton.y) : -1;
        if (line >= 0) {
          chosen = lines[line].id;
          done = true;
        } else if (!inside && e.type == ButtonPress) {
          done = true;
        }
        sawRelease = true;
        break;
      }
      case KeyPress:
        if (XLookupKeysym(&e.xkey, 0) == XK_Escape) done = true;
        break;
      default:
        break;
    }
  }
  XUngrabKeyboard(display, CurrentTime);
  XUngrabPointer(display, CurrentTime);
  XDestroyWindow(display, popup);
  XFlush(display);
  return chosen;
}

}  // namespace ulvetta
