#!/usr/bin/env python3
"""Two tones through a FIR of 32 taps, in the core's arithmetic and in doubles of NumPy, and the noise that the first adds.

    python/examples/quantisation_noise.py [PICTURE]      quantisation.png unless named

The kernel is that of a program in C++: 16-bit samples times 16-bit coefficients into accumulators of 48 bits, rounded
back to 16 bits at the end. Here registers along the tone are one block, so that each tap is one call.
"""

import sys

import matplotlib
import numpy as np

import kastarri

matplotlib.use("Agg")
import matplotlib.pyplot as plt  # noqa: E402

TAPS, LANES, SAMPLES, BITS = 32, 32, 1 << 15, 15


def low_pass():
    """A windowed sinc that passes a fifth of the band."""
    n = np.arange(TAPS) - (TAPS - 1) / 2
    taps = np.sinc(n / 5) * np.blackman(TAPS + 2)[1:-1]
    return taps / taps.sum()


def to_words(values):
    """Rounded to 16 bits with 15 of fraction."""
    return np.clip(np.rint(values * 2**BITS), -2**BITS, 2**BITS - 1).astype(np.int16)


def filter_in_registers(samples, taps):
    """y[n] = sum of taps[k] * samples[n + k], in the core's arithmetic."""
    starts = np.arange(0, len(samples) - TAPS - LANES + 1, LANES)
    acc = kastarri.MULNX16(kastarri.LVNX16_I(samples, 2 * starts), taps[0])
    for k in range(1, TAPS):
        acc = kastarri.MULANX16(acc, kastarri.LVNX16_I(samples, 2 * (starts + k)), taps[k], out=acc)
    return kastarri.PACKVRNX48(acc, BITS).reshape(-1)


def spectrum(values, length=2048):
    """In decibels of the largest tone that there is; the mean over many segments."""
    window = np.kaiser(length, 24)
    segments = np.lib.stride_tricks.sliding_window_view(values, length)[::length // 2]
    power = np.mean(np.abs(np.fft.rfft(segments * window))**2, axis=0)
    return 10 * np.log10(power / (window.sum() / 2)**2 + 1e-30)


def signal_to_noise(signal, noise):
    return 10 * np.log10(np.mean(signal**2) / np.mean(noise**2))


def main():
    picture = sys.argv[1] if len(sys.argv) > 1 else "quantisation.png"
    taps = low_pass()
    tone = sum(0.45 * np.sin(2 * np.pi * f * np.arange(SAMPLES)) for f in (0.0371, 0.3127))
    in_registers = filter_in_registers(to_words(tone), to_words(taps)) / 2**BITS
    exact = np.correlate(tone, taps)[:len(in_registers)]
    same_taps = np.correlate(tone, to_words(taps) / 2**BITS)[:len(in_registers)]
    noise, of_samples = in_registers - exact, in_registers - same_taps

    fig, axes = plt.subplots(figsize=(9, 4.2))
    for values, color, width, label in ((exact, "#c4c4c4", 3.5, "doubles"),
                                        (in_registers, "#1f5fa8", 1.4, "the core's 16 bits"),
                                        (of_samples, "#d9822b", 1.2, "what rounded samples and results add")):
        axes.plot(np.linspace(0, 0.5, 1025), spectrum(values), color=color, lw=width, label=label)
    axes.set(xlim=(0, 0.5), ylim=(-230, 10), xlabel="frequency, of the sampling rate", ylabel="dB of full scale",
             title=f"FIR of {TAPS} taps: the noise of 16 bits")
    axes.legend(loc="upper center", frameon=False)
    axes.spines[["top", "right"]].set_visible(False)
    fig.tight_layout()
    fig.savefig(picture, dpi=110)
    print(f"signal to noise: {signal_to_noise(exact, noise):.1f} dB, of samples and results alone "
          f"{signal_to_noise(exact, of_samples):.1f} dB; {picture}")


if __name__ == "__main__":
    main()
