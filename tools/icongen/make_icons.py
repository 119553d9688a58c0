#!/usr/bin/env python3
"""Draws the extension's icons (station, instruments folder, data file) and writes them as .ico.

Shapes are signed-distance functions in unit coordinates (0..1, y down), painted in order with
4x4 supersampling, so the same drawing serves every size; outline widths are given in pixels of
the target size so that the small sizes stay crisp. Payloads are 32-bit BGRA bitmaps with alpha
and an AND mask, which every icon loader understands.

Usage: make_icons.py OUTPUT_DIR [--preview PREVIEW_DIR]
"""
import math
import os
import struct
import sys
import zlib

SIZES = (16, 20, 24, 32, 48)
SUPERSAMPLE = 4


def rgba(hex_text, alpha=255):
    value = int(hex_text.lstrip('#'), 16)
    return ((value >> 16) & 255, (value >> 8) & 255, value & 255, alpha)


# --- signed distance functions (negative inside) --------------------------------------------

def circle(cx, cy, r):
    return lambda x, y: math.hypot(x - cx, y - cy) - r


def box(x0, y0, x1, y1, radius=0.0):
    cx, cy = (x0 + x1) / 2, (y0 + y1) / 2
    hx, hy = (x1 - x0) / 2 - radius, (y1 - y0) / 2 - radius

    def sdf(x, y):
        qx, qy = abs(x - cx) - hx, abs(y - cy) - hy
        outside = math.hypot(max(qx, 0.0), max(qy, 0.0))
        return outside + min(max(qx, qy), 0.0) - radius
    return sdf


def capsule(ax, ay, bx, by, r):
    def sdf(x, y):
        px, py, vx, vy = x - ax, y - ay, bx - ax, by - ay
        t = max(0.0, min(1.0, (px * vx + py * vy) / (vx * vx + vy * vy)))
        return math.hypot(px - vx * t, py - vy * t) - r
    return sdf


def polygon(points):
    """Convex or concave simple polygon: exact distance with the winding sign."""
    def sdf(x, y):
        best = float('inf')
        inside = False
        n = len(points)
        for i in range(n):
            ax, ay = points[i]
            bx, by = points[(i + 1) % n]
            vx, vy = bx - ax, by - ay
            px, py = x - ax, y - ay
            t = max(0.0, min(1.0, (px * vx + py * vy) / (vx * vx + vy * vy)))
            best = min(best, math.hypot(px - vx * t, py - vy * t))
            if (ay > y) != (by > y) and x < ax + (y - ay) * vx / vy:
                inside = not inside
        return -best if inside else best
    return sdf


def intersect(a, b):
    return lambda x, y: max(a(x, y), b(x, y))


# --- painting ---------------------------------------------------------------------------------

class Layer:
    """A shape filled with one colour (or a vertical gradient) and an inner outline."""

    def __init__(self, sdf, fill, outline=None, width=1.0, bottom=None):
        self.sdf, self.fill, self.outline, self.width, self.bottom = sdf, fill, outline, width, bottom

    def colour(self, x, y, pixel):
        d = self.sdf(x, y)
        if d > 0:
            return None
        if self.outline and d > -self.width * pixel:
            return self.outline
        if self.bottom:
            return tuple(round(a + (b - a) * min(max(y, 0), 1)) for a, b in zip(self.fill, self.bottom))
        return self.fill


def over(dst, src):
    sa = src[3] / 255.0
    da = dst[3] / 255.0
    out_a = sa + da * (1 - sa)
    if out_a == 0:
        return (0, 0, 0, 0)
    return tuple((src[i] * sa + dst[i] * da * (1 - sa)) / out_a for i in range(3)) + (out_a * 255,)


def render(layers, size):
    pixel = 1.0 / size
    rows = []
    for py in range(size):
        row = []
        for px in range(size):
            acc = [0.0, 0.0, 0.0, 0.0]
            for sy in range(SUPERSAMPLE):
                for sx in range(SUPERSAMPLE):
                    x = (px + (sx + 0.5) / SUPERSAMPLE) * pixel
                    y = (py + (sy + 0.5) / SUPERSAMPLE) * pixel
                    colour = (0, 0, 0, 0)
                    for layer in layers:
                        c = layer.colour(x, y, pixel)
                        if c is not None:
                            colour = over(colour, c)
                    a = colour[3] / 255.0
                    acc[0] += colour[0] * a
                    acc[1] += colour[1] * a
                    acc[2] += colour[2] * a
                    acc[3] += a
            n = SUPERSAMPLE * SUPERSAMPLE
            alpha = acc[3] / n
            if alpha <= 0:
                row.append((0, 0, 0, 0))
            else:
                row.append(tuple(int(round(acc[i] / acc[3])) for i in range(3)) + (int(round(alpha * 255)),))
        rows.append(row)
    return rows


# --- the drawings -----------------------------------------------------------------------------

INK = rgba('#2b2f36')
STEEL = rgba('#c9ced6')
STEEL_DARK = rgba('#7d8794')
YELLOW = rgba('#ffc21a')
YELLOW_DARK = rgba('#e89a00')
GLASS = rgba('#5fb4ff')
LCD = rgba('#9be07a')
RED = rgba('#e0402f')
WHITE = rgba('#ffffff')
PAPER_EDGE = rgba('#8a94a3')
BLUE = rgba('#3d7fd9')
WOOD = rgba('#c98a4b')
WOOD_DARK = rgba('#8f5a2b')
BLUE_DARK = rgba('#285fae')
BLUE_LIGHT = rgba('#6fa8f0')


def station(size):
    """A digital level on a tripod."""
    small = size <= 20
    leg = 0.05 if size < 40 else 0.04
    head_y = 0.56
    # Below 40 pixels an outline would eat the whole leg: the legs are then plain wood.
    leg_outline = None if size < 40 else INK
    layers = [
        # tripod legs: the rear leg darker behind the two front ones
        Layer(capsule(0.50, head_y, 0.50, 0.90, leg * 0.9), WOOD_DARK, leg_outline, 1.0),
        Layer(capsule(0.45, head_y, 0.12, 0.95, leg), WOOD, leg_outline, 1.0),
        Layer(capsule(0.55, head_y, 0.88, 0.95, leg), WOOD, leg_outline, 1.0),
        # tripod head
        Layer(box(0.30, head_y - 0.07, 0.70, head_y + 0.03, 0.02), STEEL_DARK, INK, 1.0),
        # instrument body with its handle
        Layer(box(0.30, 0.12, 0.70, 0.24, 0.04), YELLOW_DARK, INK, 1.0) if not small else None,
        Layer(box(0.10, 0.20, 0.90, 0.50, 0.07), YELLOW, INK, 1.0, bottom=YELLOW_DARK),
        # telescope: objective on the right, eyepiece on the left
        Layer(box(0.84, 0.24, 0.98, 0.46, 0.03), INK, None),
        Layer(box(0.87, 0.27, 0.96, 0.43, 0.02), GLASS, None),
        Layer(box(0.02, 0.28, 0.12, 0.42, 0.02), INK, None),
    ]
    if small:
        # the display as one bright bar
        layers.append(Layer(box(0.26, 0.29, 0.66, 0.41, 0.01), LCD, INK, 1.0))
    else:
        layers += [
            Layer(box(0.22, 0.27, 0.62, 0.43, 0.02), LCD, INK, 1.0),
            Layer(box(0.28, 0.33, 0.40, 0.37), INK, None),
            Layer(box(0.44, 0.33, 0.56, 0.37), INK, None),
            Layer(box(0.67, 0.29, 0.77, 0.35, 0.015), RED, INK, 1.0),
            Layer(box(0.67, 0.38, 0.77, 0.44, 0.015), STEEL, INK, 1.0),
        ]
    return [layer for layer in layers if layer is not None]


def folder(size):
    """A folder of instruments: a blue folder with a level and its staff standing in it."""
    small = size <= 20
    back = polygon([(0.04, 0.18), (0.38, 0.18), (0.46, 0.27), (0.96, 0.27), (0.96, 0.90), (0.04, 0.90)])
    layers = [
        Layer(back, BLUE_DARK, INK, 1.0),
        # a levelling staff, white with red marks, standing in the folder
        Layer(box(0.66, 0.06, 0.80, 0.60), WHITE, INK, 1.0),
    ]
    marks = (0.16, 0.32) if small else (0.13, 0.23, 0.33, 0.43)
    for top in marks:
        layers.append(Layer(box(0.68, top, 0.78, top + 0.05), RED, None))
    # the level peeking out of the folder
    layers += [
        Layer(box(0.14, 0.24, 0.58, 0.50, 0.05), YELLOW, INK, 1.0),
        Layer(box(0.52, 0.28, 0.64, 0.44, 0.02), INK, None),
        Layer(box(0.24, 0.30, 0.46, 0.40, 0.015), LCD, INK, 1.0),
    ]
    front = polygon([(0.02, 0.44), (0.98, 0.44), (0.94, 0.94), (0.06, 0.94)])
    layers.append(Layer(front, BLUE_LIGHT, INK, 1.0, bottom=BLUE))
    return layers


def data_file(size):
    """A data file: a page with a folded corner, rows of readings and a height profile."""
    small = size <= 20
    page = polygon([(0.16, 0.04), (0.62, 0.04), (0.86, 0.28), (0.86, 0.96), (0.16, 0.96)])
    layers = [
        Layer(page, WHITE, PAPER_EDGE if not small else INK, 1.0),
        Layer(polygon([(0.62, 0.04), (0.62, 0.28), (0.86, 0.28)]), rgba('#dfe4ea'), PAPER_EDGE, 1.0),
    ]
    rows = (0.38, 0.52) if small else (0.36, 0.46, 0.56)
    for top in rows:
        layers.append(Layer(box(0.26, top, 0.48, top + 0.05), STEEL_DARK, None))
        layers.append(Layer(box(0.54, top, 0.76, top + 0.05), BLUE, None))
    if not small:
        layers.append(Layer(box(0.26, 0.16, 0.52, 0.21), INK, None))
    # height profile across the bottom of the page, with the level's yellow
    profile = [(0.22, 0.86), (0.38, 0.74), (0.52, 0.80), (0.66, 0.68), (0.80, 0.72)]
    for (ax, ay), (bx, by) in zip(profile, profile[1:]):
        layers.append(Layer(capsule(ax, ay, bx, by, 0.05 if small else 0.035), YELLOW_DARK, None))
    return layers


ICONS = {
    'module.ico': folder,
    'station.ico': station,
    'root.ico': folder,
    'file.ico': data_file,
}


# --- file formats -----------------------------------------------------------------------------

def bmp_payload(pixels):
    size = len(pixels)
    header = struct.pack('<IiiHHIIiiII', 40, size, size * 2, 1, 32, 0, 0, 0, 0, 0, 0)
    colour = bytearray()
    for row in reversed(pixels):
        for r, g, b, a in row:
            colour += bytes((b, g, r, a))
    mask = bytearray()
    stride = ((size + 31) // 32) * 4
    for row in reversed(pixels):
        bits = bytearray(stride)
        for x, (_, _, _, a) in enumerate(row):
            if a == 0:
                bits[x // 8] |= 0x80 >> (x % 8)
        mask += bits
    return header + bytes(colour) + bytes(mask)


def write_ico(path, images):
    payloads = [bmp_payload(pixels) for pixels in images]
    out = bytearray(struct.pack('<HHH', 0, 1, len(images)))
    offset = 6 + 16 * len(images)
    for pixels, payload in zip(images, payloads):
        size = len(pixels)
        out += struct.pack('<BBBBHHII', size % 256, size % 256, 0, 0, 1, 32, len(payload), offset)
        offset += len(payload)
    for payload in payloads:
        out += payload
    with open(path, 'wb') as stream:
        stream.write(out)


def write_png(path, pixels):
    height, width = len(pixels), len(pixels[0])
    raw = b''.join(b'\0' + bytes(v for p in row for v in p) for row in pixels)

    def chunk(kind, data):
        return struct.pack('>I', len(data)) + kind + data + struct.pack('>I', zlib.crc32(kind + data))
    with open(path, 'wb') as stream:
        stream.write(b'\x89PNG\r\n\x1a\n' + chunk(b'IHDR', struct.pack('>IIBBBBB', width, height, 8, 6, 0, 0, 0))
                     + chunk(b'IDAT', zlib.compress(raw, 9)) + chunk(b'IEND', b''))


def preview(images_by_name, path, scale=6):
    """All icons at all sizes, enlarged, on a light and on a dark background."""
    names = list(images_by_name)
    cell = max(SIZES) * scale + 8
    width, height = cell * len(SIZES), cell * len(names) * 2
    canvas = [[(0, 0, 0, 255)] * width for _ in range(height)]
    for band, background in enumerate(((240, 240, 240, 255), (45, 45, 48, 255))):
        for n, name in enumerate(names):
            for s, pixels in enumerate(images_by_name[name]):
                top = (band * len(names) + n) * cell
                left = s * cell
                for y in range(cell):
                    for x in range(cell):
                        canvas[top + y][left + x] = background
                for y, row in enumerate(pixels):
                    for x, p in enumerate(row):
                        c = over(background, p)
                        for dy in range(scale):
                            for dx in range(scale):
                                canvas[top + 4 + y * scale + dy][left + 4 + x * scale + dx] = \
                                    tuple(int(v) for v in c)
    write_png(path, canvas)


def main(argv):
    if len(argv) < 2:
        print(__doc__)
        return 2
    output = argv[1]
    preview_dir = argv[argv.index('--preview') + 1] if '--preview' in argv else None
    os.makedirs(output, exist_ok=True)
    rendered = {}
    for name, drawing in ICONS.items():
        images = [render(drawing(size), size) for size in SIZES]
        write_ico(os.path.join(output, name), images)
        rendered[name] = images
    if preview_dir:
        os.makedirs(preview_dir, exist_ok=True)
        preview({k: v for k, v in rendered.items() if k != 'module.ico'},
                os.path.join(preview_dir, 'icons_preview.png'))
        for name, images in rendered.items():
            write_png(os.path.join(preview_dir, name.replace('.ico', '_32.png')), images[SIZES.index(32)])
    return 0


if __name__ == '__main__':
    sys.exit(main(sys.argv))
