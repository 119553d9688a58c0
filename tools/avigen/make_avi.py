#!/usr/bin/env python3
"""Draws the "looking for instruments" animation and writes it as an AVI for the animation control.

The station icon's digital level stands on its tripod while a magnifying glass circles over it,
showing the instrument enlarged under the lens. Shapes and colours come from the icon generator
(tools/icongen/make_icons.py), rendered with the same supersampling.

The file is what the common-controls animation control plays without a codec: one video stream,
8-bit palettised frames, RLE8-compressed, each frame a key frame that paints every pixel, and an
'idx1' index. The control paints the colour of the first frame's top-left pixel as transparent,
so the background is one key colour that no drawn pixel uses; edges that would fade into it are
blended against a neutral grey instead, and pixels covered less than half stay background.

Usage: make_avi.py OUTPUT.avi [--preview PREVIEW.png]
"""
import math
import os
import struct
import sys

sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)), '..', 'icongen'))
from make_icons import (INK, STEEL, STEEL_DARK, WHITE, GLASS, SUPERSAMPLE, Layer,  # noqa: E402
                        capsule, circle, over, rgba, station, write_png)

WIDTH, HEIGHT = 80, 64
FRAMES = 16
FRAMES_PER_SECOND = 10

# The level: the station icon drawn in a square of ICON_SIZE pixels at ICON_ORIGIN.
ICON_SIZE = 56
ICON_ORIGIN = ((WIDTH - ICON_SIZE) / 2, 6.0)

# The magnifying glass: its lens circles around the instrument's body on a flat ellipse.
ORBIT_CENTRE = (WIDTH / 2, 27.0)
ORBIT_RADII = (12.0, 5.0)
LENS_RADIUS = 10.5
RIM_WIDTH = 2.5
MAGNIFICATION = 1.5
HANDLE_LENGTH = 12.0
HANDLE_DIRECTION = (math.sqrt(0.5), math.sqrt(0.5))  # held from the lower right

KEY = (255, 0, 255)              # the background: nothing else on this palette is near it
NEUTRAL = rgba('#868b93')        # what edges blend against, so that they suit light and dark
GLASS_BACK = rgba('#eef6ff')     # the lens over empty space
GLASS_TINT = GLASS[:3] + (46,)
GLINT = WHITE[:3] + (190,)
GRIP = rgba('#3a4049')
MAX_COLOURS = 256


# --- the drawing --------------------------------------------------------------------------------

def station_colour(layers, x, y):
    """The level at a point in canvas pixels, over nothing."""
    u, v = (x - ICON_ORIGIN[0]) / ICON_SIZE, (y - ICON_ORIGIN[1]) / ICON_SIZE
    colour = (0, 0, 0, 0)
    for layer in layers:
        c = layer.colour(u, v, 1.0 / ICON_SIZE)
        if c is not None:
            colour = over(colour, c)
    return colour


def lens_centre(frame):
    angle = 2 * math.pi * frame / FRAMES
    return (ORBIT_CENTRE[0] + ORBIT_RADII[0] * math.cos(angle),
            ORBIT_CENTRE[1] - ORBIT_RADII[1] * math.sin(angle))


def magnifier_layers(cx, cy):
    """Handle and rim, in canvas pixels; the glass itself is painted by glass_colour."""
    dx, dy = HANDLE_DIRECTION
    rim = LENS_RADIUS + RIM_WIDTH
    collar_end = rim + 3.0
    grip_end = rim + HANDLE_LENGTH
    return [
        Layer(capsule(cx + dx * grip_end * 0.6, cy + dy * grip_end * 0.6,
                      cx + dx * grip_end, cy + dy * grip_end, 2.4), GRIP, INK, 1.0),
        Layer(capsule(cx + dx * (rim - 1), cy + dy * (rim - 1),
                      cx + dx * collar_end, cy + dy * collar_end, 1.9), STEEL_DARK, INK, 1.0),
        Layer(circle(cx, cy, rim), STEEL, INK, 1.0),
    ]


def glass_colour(level, cx, cy, x, y):
    """Inside the lens: the level enlarged about the lens centre, on tinted glass, with a glint."""
    distance = math.hypot(x - cx, y - cy)
    if distance > LENS_RADIUS - 0.8:
        return INK  # the rim's inner edge
    seen = station_colour(level, cx + (x - cx) / MAGNIFICATION, cy + (y - cy) / MAGNIFICATION)
    colour = over(over(GLASS_BACK, seen), GLASS_TINT)
    glint = capsule(cx - 0.62 * LENS_RADIUS, cy - 0.22 * LENS_RADIUS,
                    cx - 0.28 * LENS_RADIUS, cy - 0.60 * LENS_RADIUS, 1.1)
    if glint(x, y) <= 0:
        colour = over(colour, GLINT)
    return colour


def render_frames():
    """Each frame as rows of RGBA pixels (alpha is coverage), top row first."""
    level = station(ICON_SIZE)
    step = 1.0 / SUPERSAMPLE
    # The level outside the lens is the same in every frame: each sample is drawn once.
    still = {}
    for sy in range(HEIGHT * SUPERSAMPLE):
        for sx in range(WIDTH * SUPERSAMPLE):
            still[sx, sy] = station_colour(level, (sx + 0.5) * step, (sy + 0.5) * step)
    frames = []
    for frame in range(FRAMES):
        cx, cy = lens_centre(frame)
        glass = magnifier_layers(cx, cy)
        rows = []
        for py in range(HEIGHT):
            row = []
            for px in range(WIDTH):
                acc = [0.0, 0.0, 0.0, 0.0]
                for sy in range(py * SUPERSAMPLE, (py + 1) * SUPERSAMPLE):
                    for sx in range(px * SUPERSAMPLE, (px + 1) * SUPERSAMPLE):
                        x, y = (sx + 0.5) * step, (sy + 0.5) * step
                        colour = still[sx, sy]
                        for layer in glass:
                            c = layer.colour(x, y, 1.0)
                            if c is not None:
                                colour = over(colour, c)
                        if math.hypot(x - cx, y - cy) <= LENS_RADIUS:
                            colour = glass_colour(level, cx, cy, x, y)
                        a = colour[3] / 255.0
                        for i in range(3):
                            acc[i] += colour[i] * a
                        acc[3] += a
                coverage = acc[3] / (SUPERSAMPLE * SUPERSAMPLE)
                if acc[3] == 0:
                    row.append((0, 0, 0, 0))
                else:
                    row.append(tuple(acc[i] / acc[3] for i in range(3)) + (coverage,))
            rows.append(row)
        frames.append(rows)
    return frames


def flatten(pixel):
    """A pixel on the key background: background below half coverage, else blended on grey."""
    r, g, b, coverage = pixel
    if coverage < 0.5:
        return None
    return tuple(int(round(c * coverage + n * (1 - coverage))) for c, n in zip((r, g, b), NEUTRAL))


# --- palette ------------------------------------------------------------------------------------

def channel_spread(colours, channel):
    return max(c[channel] for c in colours) - min(c[channel] for c in colours)


def median_cut(counts, colours_wanted):
    """Up to colours_wanted colours for a {colour: pixel count} histogram, the same every run.

    The box split next is the widest one weighted by how many pixels it holds, so that the
    large flat areas keep their exact colours and the few edge blends share entries."""
    boxes = [sorted(counts)]
    while len(boxes) < colours_wanted:
        candidates = [b for b in boxes if len(b) > 1]
        if not candidates:
            break

        def priority(colours):
            spread = max(channel_spread(colours, i) for i in range(3))
            return (spread * math.log2(1 + sum(counts[c] for c in colours)), colours[0])
        widest = max(candidates, key=priority)
        channel = max(range(3), key=lambda i: channel_spread(widest, i))
        ordered = sorted(widest, key=lambda c: (c[channel], c))
        total, running, cut = sum(counts[c] for c in ordered), 0, 1
        for index, colour in enumerate(ordered[:-1]):
            running += counts[colour]
            if running * 2 >= total:
                cut = index + 1
                break
        boxes.remove(widest)
        boxes += [ordered[:cut], ordered[cut:]]
    palette = []
    for colours in boxes:
        weight = sum(counts[c] for c in colours)
        palette.append(tuple(int(round(sum(c[i] * counts[c] for c in colours) / weight))
                             for i in range(3)))
    return sorted(set(palette))


def build_palette(flat_frames):
    counts = {}
    for frame in flat_frames:
        for row in frame:
            for colour in row:
                if colour is not None:
                    counts[colour] = counts.get(colour, 0) + 1
    colours = sorted(counts)
    if len(colours) > MAX_COLOURS - 1:  # one entry is the key's
        colours = median_cut(counts, MAX_COLOURS - 1)
    # The key may not reach the drawing even where a display keeps only 5 or 6 bits a channel.
    def reduced(c):
        return (c[0] >> 3, c[1] >> 2, c[2] >> 3)
    assert all(reduced(c) != reduced(KEY) for c in colours), 'a drawn colour would turn transparent'
    return [KEY] + colours


def index_frames(flat_frames, palette):
    nearest = {}

    def lookup(colour):
        if colour is None:
            return 0
        if colour not in nearest:
            nearest[colour] = min(range(1, len(palette)), key=lambda i: sum(
                (a - b) ** 2 for a, b in zip(colour, palette[i])))
        return nearest[colour]
    return [[[lookup(c) for c in row] for row in frame] for frame in flat_frames]


# --- file format --------------------------------------------------------------------------------

def rle8(rows):
    """BI_RLE8 for rows given top first; the bitmap is stored bottom-up. Every pixel is encoded,
    so that each frame stands alone and decoders that keep or clear skipped pixels agree."""
    out = bytearray()
    bottom_up = list(reversed(rows))
    for number, row in enumerate(bottom_up):
        i, n = 0, len(row)
        literal = []

        def flush():
            while literal:
                chunk = literal[:255]
                del literal[:255]
                if len(chunk) < 3:  # absolute mode needs three or more
                    for value in chunk:
                        out.extend((1, value))
                else:
                    out.extend((0, len(chunk)))
                    out.extend(chunk)
                    if len(chunk) % 2:
                        out.append(0)
        while i < n:
            run = 1
            while i + run < n and run < 255 and row[i + run] == row[i]:
                run += 1
            if run >= 3 or (run == 2 and not literal):
                flush()
                out.extend((run, row[i]))
                i += run
            else:
                literal.extend(row[i:i + run])
                i += run
        flush()
        out.extend((0, 1) if number == len(bottom_up) - 1 else (0, 0))
    return bytes(out)


def chunk(fourcc, data):
    return fourcc + struct.pack('<I', len(data)) + data + (b'\0' if len(data) % 2 else b'')


def riff_list(kind, fourcc, body):
    return kind + struct.pack('<I', len(body) + 4) + fourcc + body


def avi_bytes(indexed_frames, palette):
    frames = [rle8(rows) for rows in indexed_frames]
    largest = max(len(f) for f in frames)
    avih = struct.pack('<14I', 1000000 // FRAMES_PER_SECOND, largest * FRAMES_PER_SECOND, 0,
                       0x10,  # AVIF_HASINDEX
                       len(frames), 0, 1, largest, WIDTH, HEIGHT, 0, 0, 0, 0)
    strh = struct.pack('<4s4sIHHIIIIIIIIhhhh', b'vids', b'RLE ', 0, 0, 0, 0,
                       1, FRAMES_PER_SECOND,  # scale and rate: frames per second
                       0, len(frames), largest, 0xFFFFFFFF, 0, 0, 0, WIDTH, HEIGHT)
    # biSizeImage is the largest frame: decoders read at most that much and stop at end-of-bitmap.
    bitmap_info = struct.pack('<IiiHHIIiiII', 40, WIDTH, HEIGHT, 1, 8, 1, largest, 0, 0,
                              len(palette), 0)
    bitmap_info += b''.join(bytes((b, g, r, 0)) for r, g, b in palette)
    header = riff_list(b'LIST', b'hdrl', chunk(b'avih', avih) + riff_list(
        b'LIST', b'strl', chunk(b'strh', strh) + chunk(b'strf', bitmap_info)))
    movie, index, offset = b'', b'', 4  # index offsets count from the 'movi' type
    for data in frames:
        piece = chunk(b'00dc', data)
        index += b'00dc' + struct.pack('<III', 0x10, offset, len(data))  # AVIIF_KEYFRAME
        movie += piece
        offset += len(piece)
    body = header + riff_list(b'LIST', b'movi', movie) + chunk(b'idx1', index)
    return riff_list(b'RIFF', b'AVI ', body)


# --- preview ------------------------------------------------------------------------------------

def preview(indexed_frames, palette, path, scale=2, gap=4):
    """Every frame as stored, enlarged, over a light and over a dark window background."""
    backgrounds = ((240, 240, 240), (45, 45, 48))
    cell_w, cell_h = WIDTH * scale + gap, HEIGHT * scale + gap
    width, height = gap + cell_w * len(indexed_frames), gap + cell_h * len(backgrounds)
    canvas = [[(128, 128, 128, 255)] * width for _ in range(height)]
    for band, background in enumerate(backgrounds):
        for number, rows in enumerate(indexed_frames):
            left, top = gap + number * cell_w, gap + band * cell_h
            for y, row in enumerate(rows):
                for x, index in enumerate(row):
                    colour = (background if index == 0 else palette[index]) + (255,)
                    for dy in range(scale):
                        line = canvas[top + y * scale + dy]
                        for dx in range(scale):
                            line[left + x * scale + dx] = colour
    write_png(path, canvas)


def main(argv):
    if len(argv) < 2 or argv[1].startswith('-'):
        print(__doc__)
        return 2
    output = argv[1]
    preview_path = argv[argv.index('--preview') + 1] if '--preview' in argv else None
    flat = [[[flatten(p) for p in row] for row in frame] for frame in render_frames()]
    palette = build_palette(flat)
    indexed = index_frames(flat, palette)
    assert all(frame[0][0] == 0 for frame in indexed), 'the top-left pixel must be the background'
    os.makedirs(os.path.dirname(os.path.abspath(output)), exist_ok=True)
    with open(output, 'wb') as stream:
        stream.write(avi_bytes(indexed, palette))
    if preview_path:
        preview(indexed, palette, preview_path)
    return 0


if __name__ == '__main__':
    sys.exit(main(sys.argv))
