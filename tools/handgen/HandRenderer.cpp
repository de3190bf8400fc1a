#include "HandRenderer.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace handgen {

namespace {

constexpr float kHalfPi = 1.57079633f;

// owners for the creases: the four fingers, the thumb, the palm, the arm
constexpr int kPalmOwner = 5, kArmOwner = 6;

struct Hit {
    float depth;
    Vec3 normal;
    float along;  // 0 at the bone's start .. 1 at its end
};

// The front hit of a view ray (straight into the screen through px, py) on a bone, a
// capsule of constant radius; the ray-capsule formula with the direction fixed to -z.
bool hitBone(const Bone& bone, double px, double py, Hit& hit) {
    const double r = bone.radius;
    const double ax = bone.a.x, ay = bone.a.y, az = bone.a.z, bx = bone.b.x, by = bone.b.y, bz = bone.b.z;
    const double top = std::max(az, bz) + r + 1;
    const double bax = bx - ax, bay = by - ay, baz = bz - az;
    const double oax = px - ax, oay = py - ay, oaz = top - az;
    const double baba = bax * bax + bay * bay + baz * baz;
    const double flat = bax * bax + bay * bay;
    auto sphere = [&](double cx, double cy, double cz, float along) {
        const double dx = px - cx, dy = py - cy, q = r * r - dx * dx - dy * dy;
        if (q < 0) return false;
        const double h = std::sqrt(q);
        hit.depth = static_cast<float>(cz + h);
        hit.normal = {static_cast<float>(dx / r), static_cast<float>(dy / r), static_cast<float>(h / r)};
        hit.along = along;
        return true;
    };
    if (flat <= 1e-9 * std::max(baba, 1e-12)) {
        // seen end-on: the nearer end's ball hides the rest
        return az >= bz ? sphere(ax, ay, az, 0) : sphere(bx, by, bz, 1);
    }
    const double bard = -baz, baoa = bax * oax + bay * oay + baz * oaz, rdoa = -oaz;
    const double oaoa = oax * oax + oay * oay + oaz * oaz;
    const double b = baba * rdoa - baoa * bard, c = baba * oaoa - baoa * baoa - r * r * baba;
    const double h = b * b - flat * c;
    if (h < 0) return false;
    const double t = (-b - std::sqrt(h)) / flat;
    const double y = baoa + t * bard;
    if (y > 0 && y < baba) {
        const double s = y / baba;
        const double hz = top - t;
        const double nx = px - (ax + bax * s), ny = py - (ay + bay * s), nz = hz - (az + baz * s);
        hit.depth = static_cast<float>(hz);
        hit.normal = {static_cast<float>(nx / r), static_cast<float>(ny / r), static_cast<float>(nz / r)};
        hit.along = static_cast<float>(s);
        return true;
    }
    return y <= 0 ? sphere(ax, ay, az, 0) : sphere(bx, by, bz, 1);
}

// The palm: a convex polygon swept by a ball, seen from the front. Inside the polygon the
// face is lit as a plane that rounds off toward its edge; outside it, within the radius,
// the rim turns from the face's normal to the outline's.
struct Palm {
    std::vector<Point> outline;
    Vec3 normal;  // toward the camera
    float radius = 0;
    float x0 = 0, y0 = 0, z0 = 0, gx = 0, gy = 0;  // the plane's depth
    float cx = 0, cy = 0;                          // the polygon's middle
    float rise = 0;                                // a plane seen askew stands out further
    bool palmSide = false;                         // the lines are drawn on the palm side only
    // palm-local millimetres from screen pixels
    float ox = 0, oy = 0, ux = 0, uy = 0, vx = 0, vy = 0, det = 0;

    explicit Palm(const HandGeometry& g) : radius(g.palmRadius) {
        for (const Vec3& v : g.palm) outline.push_back({v.x, v.y});
        if (outline.empty()) return;
        palmSide = g.palmNormal.z > 0.15f;
        normal = g.palmNormal.z >= 0 ? g.palmNormal : g.palmNormal * -1.f;
        const float nz = std::max(normal.z, 0.2f);
        x0 = g.palm[0].x;
        y0 = g.palm[0].y;
        z0 = g.palm[0].z;
        gx = -normal.x / nz;
        gy = -normal.y / nz;
        rise = radius / std::max(normal.z, 0.35f);
        ox = g.palmOrigin.x;
        oy = g.palmOrigin.y;
        ux = g.palmU.x;
        uy = g.palmU.y;
        vx = g.palmV.x;
        vy = g.palmV.y;
        det = ux * vy - uy * vx;
        // the polygon's winding decides which side of an edge is inside
        float area = 0;
        for (size_t i = 0; i < outline.size(); ++i) {
            const Point& p = outline[i];
            const Point& q = outline[(i + 1) % outline.size()];
            area += p.x * q.y - q.x * p.y;
        }
        if (area < 0) std::reverse(outline.begin(), outline.end());
        for (const Point& p : outline) {
            cx += p.x / outline.size();
            cy += p.y / outline.size();
        }
    }

    float planeDepth(float x, float y) const { return z0 + gx * (x - x0) + gy * (y - y0); }

    // signed distance to the polygon (negative inside) and the nearest outline point
    float distance(float px, float py, Point& nearest) const {
        float best = std::numeric_limits<float>::max();
        bool inside = true;
        for (size_t i = 0; i < outline.size(); ++i) {
            const Point& a = outline[i];
            const Point& b = outline[(i + 1) % outline.size()];
            const float ex = b.x - a.x, ey = b.y - a.y, wx = px - a.x, wy = py - a.y;
            if (ex * wy - ey * wx < 0) inside = false;
            const float len2 = ex * ex + ey * ey;
            const float t = len2 > 0 ? std::clamp((wx * ex + wy * ey) / len2, 0.f, 1.f) : 0;
            const float dx = wx - ex * t, dy = wy - ey * t, d2 = dx * dx + dy * dy;
            if (d2 < best) {
                best = d2;
                nearest = {a.x + ex * t, a.y + ey * t};
            }
        }
        const float d = std::sqrt(best);
        return inside ? -d : d;
    }

    bool hit(float px, float py, Hit& out) const {
        if (outline.size() < 3) return false;
        Point q;
        const float d = distance(px, py, q);
        if (d >= radius) return false;
        // toward the nearest edge, on screen
        float ex = px - q.x, ey = py - q.y;
        const float el = std::sqrt(ex * ex + ey * ey);
        if (el > 0) {
            ex /= el;
            ey /= el;
        }
        if (d < 0) {
            ex = -ex;
            ey = -ey;
        }
        // the face curves off by up to 20 degrees within a radius and a half of the edge
        const float bend = 0.35f;
        float angle;
        if (d < 0) {
            const float inner = std::min(1.f, -d / (1.5f * radius));
            angle = bend * (1 - inner);
            // deeper in, lean away from the middle rather than from the nearest edge, whose
            // direction jumps where two edges are equally near
            float mx = px - cx, my = py - cy;
            const float ml = std::sqrt(mx * mx + my * my);
            if (ml > 0) {
                ex = ex * (1 - inner) + mx / ml * inner;
                ey = ey * (1 - inner) + my / ml * inner;
                const float l = std::sqrt(ex * ex + ey * ey);
                if (l > 0) {
                    ex /= l;
                    ey /= l;
                }
            }
            out.depth = planeDepth(px, py) + rise;
        } else {
            const float s = d / radius;
            angle = bend + (kHalfPi - bend) * (std::asin(s) / kHalfPi);
            out.depth = planeDepth(q.x, q.y) + rise * std::sqrt(std::max(0.f, 1 - s * s));
        }
        const float c = std::cos(angle), s = std::sin(angle);
        out.normal = normalized(Vec3{normal.x * c + ex * s, normal.y * c + ey * s, normal.z * c});
        out.along = 0;
        return true;
    }

    // palm-local millimetres; false when the palm is seen too edge-on for lines
    bool local(float px, float py, float& u, float& v) const {
        if (std::fabs(det) < 0.3f * std::fabs(ux * ux + uy * uy)) return false;
        const float dx = px - ox, dy = py - oy;
        u = (dx * vy - dy * vx) / det;
        v = (ux * dy - uy * dx) / det;
        return true;
    }
};

// The palm's three main lines (heart, head, life) as quadratic curves in palm millimetres
// of a right hand; they darken a narrow band.
const float kPalmLines[3][3][2] = {
    {{-44, 21}, {-8, 25}, {22, 37}},
    {{37, 9}, {4, 3}, {-34, -6}},
    {{35, 7}, {9, -12}, {15, -46}},
};

float palmLineShade(float u, float v, float strength) {
    float shade = 1;
    for (const auto& line : kPalmLines) {
        float best = 1e9f;
        float px = line[0][0], py = line[0][1];
        for (int i = 1; i <= 10; ++i) {
            const float t = i / 10.f, m = 1 - t;
            const float qx = m * m * line[0][0] + 2 * m * t * line[1][0] + t * t * line[2][0];
            const float qy = m * m * line[0][1] + 2 * m * t * line[1][1] + t * t * line[2][1];
            const float ex = qx - px, ey = qy - py, wx = u - px, wy = v - py;
            const float s = std::clamp((wx * ex + wy * ey) / (ex * ex + ey * ey), 0.f, 1.f);
            const float dx = wx - ex * s, dy = wy - ey * s;
            best = std::min(best, dx * dx + dy * dy);
            px = qx;
            py = qy;
        }
        shade *= 1 - 0.22f * strength * std::exp(-best / (0.9f * 0.9f));
    }
    return shade;
}

Rgb lit(Rgb albedo, const Vec3& n, const Lighting& light) {
    const float lambert = std::max(0.f, dot(n, light.toLight));
    const float ambient = light.ambient * (0.6f + 0.4f * std::max(0.f, n.z));
    const Vec3 half = normalized(light.toLight + Vec3{0, 0, 1});
    const float glint = std::max(0.f, dot(n, half));
    const float g2 = glint * glint, g4 = g2 * g2, g8 = g4 * g4;
    const float specular = light.specular * g8 * g4;
    return albedo * (ambient + light.diffuse * lambert) * light.tint + light.tint * specular;
}

struct Scratch {
    std::vector<float> depth, colour;
    std::vector<signed char> owner;
};

}  // namespace

Rgb skinTone(float tone, float redness) {
    // lightest to darkest, 8-bit sRGB
    static const float kTones[6][3] = {{250, 221, 196}, {234, 192, 162}, {214, 164, 128},
                                       {180, 126, 92},  {128, 86, 60},   {84, 54, 38}};
    const float t = std::clamp(tone, 0.f, 1.f) * 5;
    const int i = std::min(4, static_cast<int>(t));
    const float f = t - i;
    Rgb c;
    c.r = (kTones[i][0] + (kTones[i + 1][0] - kTones[i][0]) * f) / 255;
    c.g = (kTones[i][1] + (kTones[i + 1][1] - kTones[i][1]) * f) / 255;
    c.b = (kTones[i][2] + (kTones[i + 1][2] - kTones[i][2]) * f) / 255;
    const float red = std::clamp(redness, -1.f, 1.f) * 0.06f;
    c.r *= 1 + red;
    c.g *= 1 - 0.5f * red;
    c.b *= 1 - red;
    return c;
}

void renderHand(const ScreenHand& hand, const SkinLook& look, const Lighting& light, int supersample,
                int canvasWidth, int canvasHeight, HandLayer& layer) {
    const HandGeometry& g = hand.geometry;
    const int ss = std::max(1, supersample);
    float left = 1e9f, top = 1e9f, right = -1e9f, bottom = -1e9f;
    auto grow = [&](const Vec3& v, float r) {
        left = std::min(left, v.x - r);
        right = std::max(right, v.x + r);
        top = std::min(top, v.y - r);
        bottom = std::max(bottom, v.y + r);
    };
    for (const Bone& bone : g.bones) {
        grow(bone.a, bone.radius);
        grow(bone.b, bone.radius);
    }
    for (const Vec3& v : g.palm) grow(v, g.palmRadius);
    layer.x0 = std::max(0, static_cast<int>(std::floor(left)));
    layer.y0 = std::max(0, static_cast<int>(std::floor(top)));
    const int x1 = std::min(canvasWidth, static_cast<int>(std::ceil(right)) + 1);
    const int y1 = std::min(canvasHeight, static_cast<int>(std::ceil(bottom)) + 1);
    layer.width = std::max(0, x1 - layer.x0);
    layer.height = std::max(0, y1 - layer.y0);
    layer.colour.assign(static_cast<size_t>(layer.width) * layer.height * 3, 0.f);
    layer.alpha.assign(static_cast<size_t>(layer.width) * layer.height, 0.f);
    if (layer.width == 0 || layer.height == 0) return;

    thread_local Scratch scratch;
    const int W = layer.width * ss, H = layer.height * ss;
    const size_t count = static_cast<size_t>(W) * H;
    scratch.depth.assign(count, -std::numeric_limits<float>::max());
    scratch.owner.assign(count, -1);
    scratch.colour.resize(count * 3);
    const float inv = 1.f / ss;
    const float sx0 = static_cast<float>(layer.x0), sy0 = static_cast<float>(layer.y0);
    const float k = hand.scale;  // pixels per millimetre
    const float blotch = 1 / (6 * k);

    auto store = [&](size_t i, int owner, float depth, Rgb c) {
        scratch.depth[i] = depth;
        scratch.owner[i] = static_cast<signed char>(owner);
        scratch.colour[3 * i] = c.r;
        scratch.colour[3 * i + 1] = c.g;
        scratch.colour[3 * i + 2] = c.b;
    };
    // blotches are several millimetres across: one value per output pixel is enough
    thread_local std::vector<float> blotchGrid;
    blotchGrid.resize(static_cast<size_t>(layer.width) * layer.height);
    for (int y = 0; y < layer.height; ++y)
        for (int x = 0; x < layer.width; ++x)
            blotchGrid[static_cast<size_t>(y) * layer.width + x] =
                1 + look.mottle * (2 * fractalNoise((sx0 + x + 0.5f) * blotch, (sy0 + y + 0.5f) * blotch, look.seed, 2) - 1);
    auto blotches = [&](int i, int j) { return blotchGrid[static_cast<size_t>(j / ss) * layer.width + i / ss]; };
    // palm lines a millimetre wide vanish below a pixel per millimetre
    const bool lines = look.palmLines > 0 && k >= 1;

    auto span = [&](float lo, float hi, int limit, float origin, int& from, int& to) {
        from = std::max(0, static_cast<int>(std::floor((lo - origin) * ss)));
        to = std::min(limit, static_cast<int>(std::ceil((hi - origin) * ss)) + 1);
    };

    for (const Bone& bone : g.bones) {
        int i0, i1, j0, j1;
        span(std::min(bone.a.x, bone.b.x) - bone.radius, std::max(bone.a.x, bone.b.x) + bone.radius, W, sx0, i0, i1);
        span(std::min(bone.a.y, bone.b.y) - bone.radius, std::max(bone.a.y, bone.b.y) + bone.radius, H, sy0, j0, j1);
        const bool arm = bone.part == BonePart::Forearm || bone.part == BonePart::Sleeve;
        const int owner = arm ? kArmOwner : bone.digit;
        const float boneLength = length(bone.b - bone.a) / k;
        for (int j = j0; j < j1; ++j) {
            const float py = sy0 + (j + 0.5f) * inv;
            for (int i = i0; i < i1; ++i) {
                const float px = sx0 + (i + 0.5f) * inv;
                Hit hit;
                if (!hitBone(bone, px, py, hit)) continue;
                const size_t at = static_cast<size_t>(j) * W + i;
                if (hit.depth <= scratch.depth[at]) continue;
                Rgb albedo = look.skin;
                if (bone.part == BonePart::Sleeve) {
                    // cloth folds across the sleeve
                    albedo = look.sleeve * (0.85f + 0.3f * valueNoise(hit.along * 6, 0.5f, look.seed + 7));
                } else {
                    albedo = albedo * blotches(i, j);
                    const float facing = dot(hit.normal, bone.dorsal);
                    if (!arm && bone.segment == 2 && hit.along > 0.45f && facing > 0.5f) {
                        // the nail, with a softer edge where it meets the skin
                        albedo = mix(look.skin, look.nail, facing > 0.6f && hit.along > 0.52f ? 0.55f : 0.25f);
                        if (hit.along > 0.9f) albedo = albedo * 1.06f;
                    } else if (!arm && bone.segment > 0 && hit.along * boneLength < 1.8f && facing < -0.2f) {
                        albedo = albedo * 0.8f;  // the joint's crease on the palm side
                    } else if (!arm && bone.segment == 2) {
                        albedo = albedo * Rgb{1.03f, 0.97f, 0.96f};
                    }
                }
                store(at, owner, hit.depth, lit(albedo, hit.normal, light));
            }
        }
    }

    const Palm palm(g);
    if (palm.outline.size() >= 3) {
        float l = 1e9f, r = -1e9f, t = 1e9f, b = -1e9f;
        for (const Point& p : palm.outline) {
            l = std::min(l, p.x);
            r = std::max(r, p.x);
            t = std::min(t, p.y);
            b = std::max(b, p.y);
        }
        int i0, i1, j0, j1;
        span(l - palm.radius, r + palm.radius, W, sx0, i0, i1);
        span(t - palm.radius, b + palm.radius, H, sy0, j0, j1);
        for (int j = j0; j < j1; ++j) {
            const float py = sy0 + (j + 0.5f) * inv;
            for (int i = i0; i < i1; ++i) {
                const float px = sx0 + (i + 0.5f) * inv;
                Hit hit;
                if (!palm.hit(px, py, hit)) continue;
                const size_t at = static_cast<size_t>(j) * W + i;
                if (hit.depth <= scratch.depth[at]) continue;
                Rgb albedo = look.skin * blotches(i, j);
                float u, v;
                if (palm.palmSide && lines && palm.local(px, py, u, v))
                    albedo = albedo * palmLineShade(u, v, look.palmLines);
                else if (!palm.palmSide)
                    albedo = albedo * 0.96f;
                store(at, kPalmOwner, hit.depth, lit(albedo, hit.normal, light));
            }
        }
    }

    // Creases: a part seen just behind another darkens along their meeting line.
    if (look.creases > 0) {
        const int reach = std::max(1, static_cast<int>(std::lround(1.0f * k * ss)));
        const int nearReach = std::max(1, reach / 2);
        const float step = 2.5f * k;
        const int dx[4] = {1, -1, 0, 0}, dy[4] = {0, 0, 1, -1};
        for (int j = 0; j < H; ++j) {
            for (int i = 0; i < W; ++i) {
                const size_t at = static_cast<size_t>(j) * W + i;
                const int own = scratch.owner[at];
                if (own < 0) continue;
                float shade = 1;
                for (int d = 0; d < 4 && shade > 0.5f; ++d) {
                    for (int reachOf : {nearReach, reach}) {
                        const int ni = i + dx[d] * reachOf, nj = j + dy[d] * reachOf;
                        if (ni < 0 || nj < 0 || ni >= W || nj >= H) continue;
                        const size_t n = static_cast<size_t>(nj) * W + ni;
                        const int other = scratch.owner[n];
                        if (other < 0 || other == own || scratch.depth[n] < scratch.depth[at] + step) continue;
                        shade = std::min(shade, reachOf == nearReach ? 0.5f : 0.72f);
                    }
                }
                if (shade < 1) {
                    const float s = 1 - (1 - shade) * look.creases;
                    scratch.colour[3 * at] *= s;
                    scratch.colour[3 * at + 1] *= s;
                    scratch.colour[3 * at + 2] *= s;
                }
            }
        }
    }

    const float share = 1.f / (ss * ss);
    for (int y = 0; y < layer.height; ++y) {
        for (int x = 0; x < layer.width; ++x) {
            float r = 0, gr = 0, b = 0;
            int covered = 0;
            for (int j = 0; j < ss; ++j) {
                const size_t base = static_cast<size_t>(y * ss + j) * W + x * ss;
                for (int i = 0; i < ss; ++i) {
                    const size_t at = base + i;
                    if (scratch.owner[at] < 0) continue;
                    ++covered;
                    r += scratch.colour[3 * at];
                    gr += scratch.colour[3 * at + 1];
                    b += scratch.colour[3 * at + 2];
                }
            }
            const size_t o = static_cast<size_t>(y) * layer.width + x;
            layer.alpha[o] = covered * share;
            layer.colour[3 * o] = r * share;
            layer.colour[3 * o + 1] = gr * share;
            layer.colour[3 * o + 2] = b * share;
        }
    }
}

void composite(const HandLayer& layer, Canvas& canvas) {
    for (int y = 0; y < layer.height; ++y) {
        float* row = canvas.row(layer.y0 + y) + 3 * layer.x0;
        for (int x = 0; x < layer.width; ++x) {
            const size_t o = static_cast<size_t>(y) * layer.width + x;
            const float a = layer.alpha[o];
            if (a <= 0) continue;
            row[3 * x] = row[3 * x] * (1 - a) + layer.colour[3 * o];
            row[3 * x + 1] = row[3 * x + 1] * (1 - a) + layer.colour[3 * o + 1];
            row[3 * x + 2] = row[3 * x + 2] * (1 - a) + layer.colour[3 * o + 2];
        }
    }
}

}  // namespace handgen
