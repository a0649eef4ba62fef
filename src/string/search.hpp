// Finding one byte string in another, near the speed of memory whatever the
// search string, in linear time and constant space.
//
// LOCATE and REPLACE are defined as left-to-right searches: try each
// position, and a failed comparison moves on by one byte.  Done literally
// that is quadratic (3999 'a' and a 'b' in a megabyte of 'a'), and the
// Two-Way algorithm alone, linear as it is, crawls through periodic text a
// few bytes per attempt.  The search here finds the same first match in
// stages; each stage counts what its failed attempts cost and hands over
// to the next once that passes what the scan itself costs, so the whole
// stays linear.  A stage that hands over returns, and a loop runs the next,
// so that no stage calls another and the depth of calls is the same for
// every text:
//
//  1. The needle's rarest byte, by a rough table of how often bytes occur
//     in text, is looked for with the C library's memchr, the fastest scan
//     there is while that byte is rare in the haystack too; each place
//     found is tried.  Of a long needle only both ends and a sample between
//     them are looked at for that byte: nothing here costs time per needle
//     byte before the scan needs it.
//  2. A filter tests 16 or 32 positions at once: do the haystack's bytes at
//     a few chosen offsets of the needle equal the needle's there?  Only
//     the positions that pass are compared in full.  The first two offsets
//     are the rarest byte's last place and the rarest other byte's first,
//     so that a needle that breaks its period at either end is told apart
//     from the period.
//  3. Text can defeat any fixed choice: `aab..aaa` in `aabaab..` passes a
//     filter on its 'b' and its first 'a' at every third position.  Then
//     the offsets are chosen from the haystack at hand, twice at most: the
//     ones at which the fewest of the next 64 positions agree with the
//     needle, enough to rule them all out the first time, eight the second.
//     The offsets tried are a sample of the needle's and the last few at
//     which full comparisons failed, so that a needle that differs from the
//     text at one place anywhere is told apart by that place.
//  4. Text that defeats even that (made to, or with a needle whose telling
//     bytes the sample can't see) goes to Two-Way (Crochemore and Perrin),
//     which compares at most about 2n bytes with O(1) memory.  Only this
//     stage reads the whole needle before it scans, to factor it, and runs
//     of whole periods in the needle are read a word at a time.  Text made
//     to defeat the filter is mostly near-copies of a periodic needle: there
//     a place can only match where the text repeats itself at the needle's
//     period, and one place where it doesn't rules out the places before.
//
// Nothing is allocated.  The filter's inner loop is a kernel for the widest
// instruction set the processor has (search_kernels.hpp).
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "frame/frame.hpp"
#include "string/search_detail.hpp"
#include "string/search_kernels.hpp"

namespace cli::str {

inline constexpr std::size_t kNotFound = static_cast<std::size_t>(-1);

class Searcher {
 public:
  class Scan;

  // The filter runs on `kernel`, by default the fastest one here.
  explicit Searcher(Bytes needle, const FilterKernel &kernel = bestFilterKernel()) noexcept
      : x_(needle.data), m_(needle.size), kernel_(&kernel) {
    if (m_ >= 2) pickByRank();
  }

  // The first position at or after `from` where the needle stands in
  // `haystack` in full, or kNotFound.  An empty needle stands at `from`.
  [[nodiscard]] std::size_t find(Bytes haystack, std::size_t from) const noexcept {
    return Scan(*this, haystack).next(from);
  }

  // A search for successive matches in one haystack, each call starting at
  // or behind where the last one ended; what the scan has learnt of the
  // haystack carries over from call to call.
  class Scan {
   public:
    Scan(const Searcher &searcher, Bytes haystack) noexcept
        : s_(searcher), h_(haystack.data), n_(haystack.size) {
      // The first pair only: the other probes are set when they are chosen.
      probes_.count = 2;
      for (std::size_t k = 0; k < 2; ++k) {
        probes_.offset[k] = s_.first_.offset[k];
        probes_.byte[k] = s_.first_.byte[k];
      }
    }

    // The first match at or after `from`, which is never below the `from`
    // of an earlier call; kNotFound when there is none.
    [[nodiscard]] std::size_t next(std::size_t from) noexcept {
      const std::size_t m = s_.m_;
      if (from > n_ || m > n_ - from) return kNotFound;
      if (m == 0) return from;
      if (m == 1) {
        const void *hit = std::memchr(h_ + from, s_.x_[0], n_ - from);
        return hit == nullptr ? kNotFound
                              : static_cast<std::size_t>(static_cast<const Byte *>(hit) - h_);
      }
      // A stage that hands over returns kHandOver, and the next stage goes
      // on from where the budget of the new one starts.  The first stage
      // hands over only to the filter, and the rest run in a loop.
      if (stage_ == Stage::rareByte) {
        const std::size_t at = rareByte(from);
        if (at != kHandOver) return at;
        from = since_;
      }
      return laterStages(from);
    }

   private:
    enum class Stage : std::uint8_t { rareByte, filter, twoWay };

    // What a stage returns when it leaves the rest to the next one; never a
    // position, which is below the haystack's size.
    static constexpr std::size_t kHandOver = kNotFound - 1;

    // The filter, with its offsets chosen again twice at most, and Two-Way,
    // which never hands over: the loop turns at most four times, and no
    // stage calls another.  Kept out of line, so that a short search that
    // the first stage ends pays nothing for the others.
    [[gnu::noinline]] std::size_t laterStages(std::size_t from) noexcept {
      for (;;) {
        if (stage_ == Stage::twoWay) return twoWayFind(from);
        const std::size_t at = filtered(from);
        if (at != kHandOver) return at;
        from = since_;
      }
    }

    // What one place that the current stage tries but that fails in full
    // counts, in bytes of scanning, besides the bytes it compares: a
    // mispredicted branch and a comparison cost about as much as the filter
    // takes for 256 positions.  A byte compared costs about four scanned.
    static constexpr std::size_t kMissCost = 256;
    static constexpr std::size_t kCompareCost = 4;
    // What one call of memchr that ends in a match counts.
    static constexpr std::size_t kCallCost = 64;
    // Scanning allowed before a stage is judged.
    static constexpr std::size_t kGrace = 1024;
    // How often the offsets may be chosen from the haystack, and how many
    // misses the last choice may cost before Two-Way, which compares about
    // two bytes per haystack byte, would be the faster.
    static constexpr int kChoices = 2;
    static constexpr std::size_t kLastChoiceAllowance = 8;

    [[nodiscard]] bool overBudget(std::size_t at) const noexcept {
      const std::size_t allowance = choices_ == kChoices ? kLastChoiceAllowance : 1;
      return spent_ > (at - since_) * allowance + kGrace;
    }

    // Stages 2 and 3: the kernel finds blocks with positions that pass the
    // probes, and each such position is compared in full.  A match leaves
    // the rest of its block for the next call.
    std::size_t filtered(std::size_t from) noexcept {
      const std::size_t m = s_.m_, last = n_ - m, lanes = s_.kernel_->lanes;
      std::size_t base = from, next = from;
      std::uint64_t mask = 0;
      if (pending_ != 0 && from >= pendingBase_ && from - pendingBase_ < lanes) {
        base = pendingBase_;
        mask = pending_ & (~std::uint64_t{0} << (from - pendingBase_));
        next = base + lanes;
      }
      pending_ = 0;
      for (;;) {
        while (mask != 0) {
          const std::size_t at = base + static_cast<std::size_t>(std::countr_zero(mask));
          mask &= mask - 1;
          const std::size_t i = search_detail::mismatch(s_.x_, h_ + at, 0, m);
          if (i == m) {
            pending_ = mask;
            pendingBase_ = base;
            return at;
          }
          spent_ += kMissCost + kCompareCost * i;
          learn(i);
          if (overBudget(at)) return adapt(at + 1);
        }
        if (next > last) return kNotFound;
        base = s_.kernel_->scan(h_, next, last, probes_, mask);
        if (base == kNotFound) return kNotFound;
        next = base + lanes;
      }
    }

    // Stage 1, while the needle's rarest byte is rare in the haystack too:
    // the C library's memchr finds its next place, the fastest scan there
    // is, and only those places are tried.
    std::size_t rareByte(std::size_t from) noexcept {
      const std::size_t m = s_.m_, last = n_ - m;
      const std::size_t a = probes_.offset[0], b = probes_.offset[1];
      for (std::size_t j = from; j <= last;) {
        const void *hit = std::memchr(h_ + j + a, probes_.byte[0], last - j + 1);
        if (hit == nullptr) return kNotFound;
        const std::size_t at = static_cast<std::size_t>(static_cast<const Byte *>(hit) - h_) - a;
        std::size_t i = 0;
        if (h_[at + b] == probes_.byte[1]) {
          i = search_detail::mismatch(s_.x_, h_ + at, 0, m);
          if (i == m) {
            // A call per match is dear where matches lie close together:
            // the filter then finds the next ones in the same block.
            spent_ += kCallCost;
            if (overBudget(at)) leave(Stage::filter, at + 1);
            return at;
          }
          learn(i);
        }
        spent_ += kMissCost + kCompareCost * i;
        if (overBudget(at)) return adapt(at + 1);
        j = at + 1;
      }
      return kNotFound;
    }

    // The current stage passes too many places that fail from `from` on:
    // go on to the filter, choose its offsets again from the haystack there,
    // or leave the rest to Two-Way.  The stage that called returns what this
    // returns, and next() runs the new stage from `from`.
    std::size_t adapt(std::size_t from) noexcept {
      const std::size_t last = n_ - s_.m_;
      if (stage_ == Stage::rareByte) {
        leave(Stage::filter, from);
      } else if (choices_ < kChoices && from <= last && last - from + 1 >= kSample) {
        // The first choice stops once the sample is ruled out; should that
        // prove too few offsets, the second takes all eight.
        leave(Stage::filter, from);
        pickFromSample(from, choices_ == 0 ? 2 : kMaxProbes);
        ++choices_;
      } else {
        leave(Stage::twoWay, from);
      }
      return kHandOver;
    }

    // The offset at which a full comparison failed, kept among the last
    // kLearned distinct ones for the next choice of offsets, unless the
    // sample holds it anyway: every offset of a short needle and the 64 at
    // each end of a long one.  Random text fails early and often, and then
    // this costs no more than a comparison.
    void learn(std::size_t offset) noexcept {
      const std::size_t m = s_.m_;
      if (m <= kSampledOffsets || offset < 64 || offset >= m - 64) return;
      for (std::size_t k = 0; k < learnedCount_; ++k) {
        if (learned_[k] == offset) return;
      }
      learned_[learnedNext_] = offset;
      learnedNext_ = (learnedNext_ + 1) % kLearned;
      if (learnedCount_ < kLearned) ++learnedCount_;
    }

    // Goes on to `stage` with nothing spent from `from` on.
    void leave(Stage stage, std::size_t from) noexcept {
      stage_ = stage;
      spent_ = 0;
      since_ = from;
    }

    // ---- Choosing offsets from the haystack -----------------------------

    static constexpr std::size_t kSample = 64;  // positions, one bit each
    static constexpr std::size_t kSampledOffsets = 256;
    static constexpr std::size_t kLearned = 4;
    static constexpr std::size_t kOffsets = kLearned + kSampledOffsets;

    // The offsets of the needle whose bytes the fewest of the positions
    // [from, from + 64) agree with, added one at a time while each still
    // rules out more of them, at least `least` and up to eight.
    void pickFromSample(std::size_t from, std::size_t least) noexcept {
      const std::size_t m = s_.m_;
      std::size_t offsets[kOffsets];
      std::uint64_t agree[kOffsets];
      // The offsets where full comparisons failed, then every offset of a
      // short needle, or of a long one the 64 at each end and 128 spread
      // between them, but for those learnt.
      std::size_t k = 0;
      for (; k < learnedCount_; ++k) offsets[k] = learned_[k];
      const std::size_t sampled = m <= kSampledOffsets ? m : kSampledOffsets;
      for (std::size_t c = 0; c < sampled; ++c) {
        const std::size_t offset = m <= kSampledOffsets ? c
                                   : c < 64             ? c
                                   : c >= 192           ? m - 256 + c
                                                        : 64 + (c - 64) * (m - 128) / 128;
        bool learnt = false;
        for (std::size_t l = 0; l < learnedCount_; ++l) learnt = learnt || learned_[l] == offset;
        if (!learnt) offsets[k++] = offset;
      }
      for (std::size_t c = 0; c < k; ++c) {
        agree[c] = s_.kernel_->agree64(h_ + from + offsets[c], s_.x_[offsets[c]]);
      }
      // Each round takes the unused offset that leaves the fewest positions
      // alive, the rarer byte in the sample on a tie.
      std::uint64_t alive = ~std::uint64_t{0};
      bool used[kOffsets] = {};
      std::size_t chosen[kMaxProbes];
      std::size_t n = 0;
      while (n < kMaxProbes && !(n >= least && alive == 0)) {
        std::size_t best = kNotFound;
        int fewest = 0;
        for (std::size_t c = 0; c < k; ++c) {
          const int key = std::popcount(alive & agree[c]) * 128 + std::popcount(agree[c]);
          if (!used[c] && (best == kNotFound || key < fewest)) {
            fewest = key;
            best = c;
          }
        }
        if (best == kNotFound) break;  // every offset taken
        // Positions that no offset rules out are matches: stop there.
        if (n >= 2 && alive != 0 && (alive & agree[best]) == alive) break;
        used[best] = true;
        chosen[n++] = offsets[best];
        alive &= agree[best];
      }
      setProbes(chosen, n);
    }

    // ---- The filter's offsets -------------------------------------------

    static constexpr std::size_t kMaxProbes = Probes::kMax;

    void setProbes(const std::size_t *offsets, std::size_t n) noexcept {
      probes_.count = n;
      for (std::size_t k = 0; k < n; ++k) {
        probes_.offset[k] = offsets[k];
        probes_.byte[k] = s_.x_[offsets[k]];
      }
    }

    // ---- Two-Way --------------------------------------------------------

    std::size_t twoWayFind(std::size_t from) noexcept {
      if (!factored_) factor();
      const Byte *x = s_.x_;
      const std::size_t m = s_.m_, last = n_ - m, s = suffix_, p = period_;
      const Byte first = x[s];
      std::size_t j = from, memory = 0;
      // The haystack is known to repeat itself at distance p from j + p or
      // before up to cleanTo.
      std::size_t cleanTo = 0;
      while (j <= last) {
        // A needle of period p matches only where the haystack repeats
        // itself at distance p over [j + p, j + m), h[t] == h[t - p].  The
        // window is looked at from its end down to what is known, so that
        // each byte is looked at once; a break at t rules out every place up
        // to t - p, and what lies above it is known to repeat.
        if (periodic_ && cleanTo < j + m) {
          const std::size_t low = cleanTo > j + p ? cleanTo : j + p;
          const std::size_t i = search_detail::mismatchDown(h_, h_ + p, j + m - p, low - p);
          cleanTo = j + m;
          if (i + 1 != low - p) {  // a break at i + p
            j = i + 1;
            memory = 0;
            continue;
          }
        }
        if (memory == 0 && h_[j + s] != first) {
          // Two-Way moves on by one place while the first byte it compares
          // differs: the next place where it doesn't is found in one word,
          // or else by memchr.
          j = nextWith(first, s, j + 1);
          if (j == kNotFound) return kNotFound;
        }
        const std::size_t start = s > memory ? s : memory;
        std::size_t i = search_detail::mismatch(x, h_ + j, start, m);
        if (i < m) {
          j += i - s + 1;
          memory = 0;
          continue;
        }
        i = search_detail::mismatchDown(x, h_ + j, s, memory);
        if (i + 1 < memory + 1) return j;
        j += period_;
        memory = periodic_ ? m - period_ : 0;
      }
      return kNotFound;
    }

    // The first place j, from `from` to the last, where the haystack holds
    // `byte` at j + offset; kNotFound if none.
    [[nodiscard]] std::size_t nextWith(Byte byte, std::size_t offset,
                                       std::size_t from) const noexcept {
      const std::size_t last = n_ - s_.m_;
      if (from > last) return kNotFound;
      if (last - from >= 8) {
        const std::size_t at = search_detail::firstEqual(h_ + from + offset, byte);
        if (at < 8) return from + at;
        from += 8;
      }
      const void *hit = std::memchr(h_ + from + offset, byte, last - from + 1);
      return hit == nullptr
                 ? kNotFound
                 : static_cast<std::size_t>(static_cast<const Byte *>(hit) - h_) - offset;
    }

    // The critical factorization: the later of the two maximal suffixes,
    // under the byte order and under its reverse.  Without a period of the
    // whole needle, any shift up to the longer part's length plus one is
    // safe and no memory is kept.
    void factor() noexcept {
      const std::size_t m = s_.m_;
      const Suffix forward = maximalSuffix(false);
      const Suffix reverse = maximalSuffix(true);
      const Suffix &critical = reverse.start + 1 < forward.start + 1 ? forward : reverse;
      suffix_ = critical.start + 1;
      period_ = critical.period;
      periodic_ = std::memcmp(s_.x_, s_.x_ + period_, suffix_) == 0;
      if (!periodic_) period_ = (suffix_ > m - suffix_ ? suffix_ : m - suffix_) + 1;
      factored_ = true;
    }

    struct Suffix {
      std::size_t start;  // one before the suffix; kNotFound (as -1) for the whole needle
      std::size_t period;
    };
    // The maximal suffix of the needle and its period, by Crochemore and
    // Perrin; unsigned arithmetic wraps start from -1 on purpose.  The
    // candidate x[start + 1, j + k) has period p, and j - start is a multiple
    // of p, so that comparing x[j + k] with x[start + k] compares it with
    // x[j + k - p]: once a whole period agrees, the bytes that go on agreeing
    // are found a word at a time, which makes a needle of short period cost
    // about what reading it costs.
    [[nodiscard]] Suffix maximalSuffix(bool reversed) const noexcept {
      const Byte *x = s_.x_;
      const std::size_t m = s_.m_;
      std::size_t start = kNotFound, j = 0, k = 1, p = 1;
      while (j + k < m) {
        const Byte a = x[j + k], b = x[start + k];
        if (a == b) {
          if (k != p) {
            ++k;
            continue;
          }
          j += p;
          // From q = j + 1 on, the first place where x[q] != x[q - p], d
          // bytes on: j moves by the whole periods in d, k by the rest.
          const std::size_t q = j + 1;
          const std::size_t d = q < m ? search_detail::mismatch(x + p, x, q - p, m - p) + p - q : 0;
          j += d / p * p;
          k = d % p + 1;
        } else if (reversed ? b < a : a < b) {
          j += k;
          k = 1;
          p = j - start;
        } else {
          start = j++;
          k = p = 1;
        }
      }
      return {start, p};
    }

    const Searcher &s_;
    const Byte *h_;
    std::size_t n_;

    Probes probes_{};

    std::size_t spent_ = 0;  // bytes' worth of failed full comparisons since `since_`
    std::size_t since_ = 0;
    int choices_ = 0;

    std::size_t learned_[kLearned] = {};  // offsets where full comparisons failed
    std::size_t learnedCount_ = 0, learnedNext_ = 0;

    std::uint64_t pending_ = 0;  // positions of the last block not yet tried, if any
    std::size_t pendingBase_ = 0;

    Stage stage_ = Stage::rareByte;
    bool factored_ = false;
    std::size_t suffix_ = 0, period_ = 1;
    bool periodic_ = false;
  };

 private:
  // Of a needle longer than kLookedAt bytes, the first pair is chosen among
  // its first and last kEnds bytes and kSpread bytes spread evenly between.
  static constexpr std::size_t kEnds = 128, kSpread = 256, kLookedAt = 2 * kEnds + kSpread;

  // The first pair of offsets: the rarest byte's last place, and the first
  // place of the rarest other byte (of the same byte where there is no
  // other, at the far end), among the bytes looked at.
  void pickByRank() noexcept {
    if (m_ <= kLookedAt) {
      pickAmong(x_, m_, [](std::size_t i) { return i; });
      return;
    }
    const std::size_t step = (m_ - 2 * kEnds) / kSpread;
    const auto offsetOf = [&](std::size_t i) {
      return i < kEnds ? i : i < kEnds + kSpread ? kEnds + (i - kEnds) * step : m_ - kLookedAt + i;
    };
    Byte sample[kLookedAt];
    for (std::size_t i = 0; i < kLookedAt; ++i) sample[i] = x_[offsetOf(i)];
    pickAmong(sample, kLookedAt, offsetOf);
  }

  // The pair among the n bytes at `bytes`, of which byte i stands at
  // offsetOf(i) in the needle.
  template <class OffsetOf>
  void pickAmong(const Byte *bytes, std::size_t n, OffsetOf offsetOf) noexcept {
    const auto &rank = search_detail::kByteRank;
    std::size_t a = 0;
    for (std::size_t i = 1; i < n; ++i) {
      if (rank[bytes[i]] <= rank[bytes[a]]) a = i;
    }
    std::size_t b = kNotFound;
    for (std::size_t i = 0; i < n; ++i) {
      if (bytes[i] != bytes[a] && (b == kNotFound || rank[bytes[i]] < rank[bytes[b]])) b = i;
    }
    if (b == kNotFound) b = a == 0 ? n - 1 : 0;
    first_.count = 2;
    first_.offset[0] = offsetOf(a);
    first_.offset[1] = offsetOf(b);
    first_.byte[0] = bytes[a];
    first_.byte[1] = bytes[b];
  }

  const Byte *x_;
  std::size_t m_;
  const FilterKernel *kernel_;
  Probes first_{};  // the first pair of offsets, and the needle's bytes there
};

}  // namespace cli::str
