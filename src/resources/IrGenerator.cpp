// Synthesises the three stored stereo impulse responses of the convolution reverbs and writes them, one
// after the other, as interleaved little-endian float32 frames at 44100 Hz.
//
// Acoustic model. Each room is a direct arrival at frame 0 followed by a handful of distinct early
// reflections (image sources of the nearest walls, each arriving a little earlier at one ear than at the
// other, attenuated with distance and alternating in sign), then a diffuse late field. The late field is
// independent noise per ear, split into low (below ~500 Hz), middle and high (above ~4 kHz) bands; each band
// decays exponentially with its own reverberation time (air and wall absorption make the highs die
// faster than the lows), and the field builds up over the first tens of milliseconds as reflections
// multiply. Independent noise for the two ears keeps their correlation low, as in a real diffuse field.
// The end of each response fades out; the second ends in a stretch of exact zeros.
//
// The generator is deterministic: a fixed integer noise generator and the host's maths library, run on the
// build machine for every build, so the Linux and Windows modules embed the same bytes.
//
// Usage: IrGenerator OUTPUT
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <vector>

namespace {

constexpr double kRate = 44100.0;
constexpr double kPi = 3.141592653589793;

struct Room {
    int frames;
    uint64_t seed;
    double t60;         // reverberation time of the middle band, seconds
    double lowRatio;    // T60 of the low band relative to the middle
    double highRatio;   // T60 of the high band relative to the middle
    double highLevel;   // level of the high band in the late field (brightness)
    double lateLevel;   // level of the late field relative to the direct arrival (the bright hall's strong
                        // direct sound stands far above its tail, which keeps its loudness near the others')
    double buildUp;     // time constant of the late field's build-up, seconds
    double peak;        // peak magnitude of the stored response
    int zeroTail;       // frames of exact zeros at the end
};

// Stored order: the bright hall, the large room, the auditorium.
const Room kRooms[3] = {
    {104830, 0x9E3779B97F4A7C15ull, 2.05, 1.35, 0.60, 1.00, 0.10, 0.030, 0.30, 0},
    {135168, 0xD1B54A32D192ED03ull, 1.95, 1.40, 0.50, 0.55, 0.70, 0.050, 0.064, 5888},
    {103898, 0x94D049BB133111EBull, 1.80, 1.45, 0.45, 0.40, 0.65, 0.040, 0.060, 0},
};

// xorshift64*: a small, fully specified generator; uniform in [-1, 1).
struct Noise {
    uint64_t s;
    double next() {
        s ^= s >> 12;
        s ^= s << 25;
        s ^= s >> 27;
        const uint64_t v = s * 0x2545F4914F6CDD1Dull;
        return static_cast<double>(v >> 11) * (2.0 / 9007199254740992.0) - 1.0;
    }
};

// Two cascaded one-pole low-passes at fc.
struct LowPass2 {
    double a, y1 = 0.0, y2 = 0.0;
    explicit LowPass2(double fc) : a(1.0 - std::exp(-2.0 * kPi * fc / kRate)) {}
    double run(double x) {
        y1 += a * (x - y1);
        y2 += a * (y1 - y2);
        return y2;
    }
};

std::vector<double> lateField(const Room& room, Noise& noise) {
    std::vector<double> out(room.frames);
    LowPass2 low(500.0), belowHigh(4000.0);
    const double kLn1000 = 6.907755278982137;  // 60 dB of decay
    const double rMid = kLn1000 / room.t60, rLow = kLn1000 / (room.t60 * room.lowRatio),
                 rHigh = kLn1000 / (room.t60 * room.highRatio);
    for (int n = 0; n < room.frames; ++n) {
        const double t = n / kRate;
        const double w = noise.next();
        const double lo = low.run(w);
        const double notHigh = belowHigh.run(w);
        const double hi = w - notHigh;
        const double mid = notHigh - lo;
        const double v = lo * 2.0 * std::exp(-rLow * t) + mid * std::exp(-rMid * t) +
                         hi * room.highLevel * std::exp(-rHigh * t);
        const double rise = 1.0 - std::exp(-t / room.buildUp);
        out[n] = v * rise * rise;
    }
    return out;
}

void addReflections(std::vector<double>& ch, int earOffset, Noise& noise) {
    // The direct arrival, then reflections from 4 to 70 ms.
    ch[0] += 1.0;
    const double delaysMs[] = {4.1, 7.3, 11.9, 16.4, 23.8, 31.2, 42.7, 55.1, 69.6};
    double sign = -1.0;
    for (double d : delaysMs) {
        const int at = static_cast<int>(d * 0.001 * kRate) + earOffset + static_cast<int>(noise.next() * 8.0);
        const double amplitude = 0.8 * 5.0 / (5.0 + d) * (0.8 + 0.2 * noise.next());
        // A slightly smeared click: walls are not perfect mirrors.
        const double smear[] = {0.25, 1.0, 0.5, 0.15};
        for (int k = 0; k < 4; ++k)
            if (at + k >= 0 && at + k < static_cast<int>(ch.size())) ch[at + k] += sign * amplitude * smear[k];
        sign = -sign;
    }
}

std::vector<float> makeRoom(const Room& room) {
    Noise noise{room.seed};
    std::vector<double> left = lateField(room, noise);
    std::vector<double> right = lateField(room, noise);
    for (double& v : left) v *= room.lateLevel;
    for (double& v : right) v *= room.lateLevel;
    addReflections(left, 0, noise);
    addReflections(right, 17, noise);  // the other ear hears each wall a little later
    // Fade out over the last 3% of the sounding part; then exact zeros.
    const int sounding = room.frames - room.zeroTail;
    const int fade = sounding * 3 / 100;
    for (int n = 0; n < room.frames; ++n) {
        double g = 1.0;
        if (n >= sounding)
            g = 0.0;
        else if (n >= sounding - fade)
            g = static_cast<double>(sounding - n) / fade;
        left[n] *= g;
        right[n] *= g;
    }
    double peak = 0.0;
    for (int n = 0; n < room.frames; ++n) peak = std::fmax(peak, std::fmax(std::fabs(left[n]), std::fabs(right[n])));
    const double scale = room.peak / peak;
    std::vector<float> out(2 * static_cast<size_t>(room.frames));
    for (int n = 0; n < room.frames; ++n) {
        out[2 * n] = static_cast<float>(left[n] * scale);
        out[2 * n + 1] = static_cast<float>(right[n] * scale);
    }
    return out;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 2) {
        std::fprintf(stderr, "usage: IrGenerator OUTPUT\n");
        return 2;
    }
    std::FILE* f = std::fopen(argv[1], "wb");
    if (f == nullptr) {
        std::fprintf(stderr, "cannot write %s\n", argv[1]);
        return 1;
    }
    for (const Room& room : kRooms) {
        const std::vector<float> data = makeRoom(room);
        // Little-endian float32, whatever the host.
        for (float v : data) {
            uint32_t bits;
            static_assert(sizeof bits == sizeof v, "float is 32 bits");
            std::memcpy(&bits, &v, sizeof bits);
            const unsigned char b[4] = {static_cast<unsigned char>(bits), static_cast<unsigned char>(bits >> 8),
                                        static_cast<unsigned char>(bits >> 16), static_cast<unsigned char>(bits >> 24)};
            if (std::fwrite(b, 1, 4, f) != 4) {
                std::fclose(f);
                return 1;
            }
        }
    }
    return std::fclose(f) == 0 ? 0 : 1;
}
