#pragma once

/// Points, sizes and rectangles in single precision. What y means (up or down) is said where one is used.

struct KXPoint {
    float x = 0;
    float y = 0;
    friend bool operator==(const KXPoint&, const KXPoint&) = default;
};

struct KXSize {
    float width = 0;
    float height = 0;
    friend bool operator==(const KXSize&, const KXSize&) = default;
};

struct KXRect {
    float x = 0;
    float y = 0;
    float width = 0;
    float height = 0;
    float minX() const { return x; }
    float minY() const { return y; }
    float maxX() const { return x + width; }
    float maxY() const { return y + height; }
    KXPoint origin() const { return {x, y}; }
    KXSize size() const { return {width, height}; }
    /// Not on the edges that have the greater coordinates.
    bool contains(KXPoint p) const { return p.x >= minX() && p.x < maxX() && p.y >= minY() && p.y < maxY(); }
    friend bool operator==(const KXRect&, const KXRect&) = default;
};
