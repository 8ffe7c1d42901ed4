/// How much heap a piece of work needs: the most that the process held while it ran, above what it held before.
///
/// All threads count, the server's and the simulated libraries' too. Outside a window nothing is counted.
#pragma once

namespace nvrbench {

class Heap_Window {
public:
    Heap_Window();
    ~Heap_Window();
    Heap_Window(const Heap_Window&) = delete;
    Heap_Window& operator=(const Heap_Window&) = delete;

    /// The most until now, in units of 1,024 bytes.
    double peak_kilobytes() const;
    /// What is held now.
    double held_kilobytes() const;
};

/// The peak of one run of `work`.
template <class Work>
double peak_kilobytes_of(Work work)
{
    const Heap_Window window;
    work();
    return window.peak_kilobytes();
}

} // namespace nvrbench
