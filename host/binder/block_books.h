// BlockBooks: which parts of a heap are taken. Pure bookkeeping, not safe for several threads at once.
//
// Pieces are multiples of kGrain bytes. A piece is found by best fit, the lowest of several; pieces
// given back join their free neighbours, so free pieces never touch.
#pragma once

#include <stddef.h>
#include <stdint.h>

#include <map>
#include <optional>
#include <set>
#include <utility>

namespace android {

class BlockBooks {
 public:
  static constexpr size_t kGrain = 32;

  // `bytes` is rounded down to the grain.
  explicit BlockBooks(size_t bytes);

  // What a taken piece is known by. The ticket is never used again, so a piece can be told from a
  // later one at the same place. Tickets are not 0.
  struct Piece {
    size_t offset;
    size_t bytes;
    uint64_t ticket;
  };

  // `bytes` is at least 1 and rounded up to the grain.
  std::optional<Piece> take(size_t bytes);

  // Gives back the piece that begins at `offset`, if it has that ticket, or if `ticket` is kAnyTicket.
  // Returns it, or nothing where no such piece is taken.
  static constexpr uint64_t kAnyTicket = 0;
  std::optional<Piece> giveBack(size_t offset, uint64_t ticket);

 private:
  void addFree(size_t offset, size_t bytes);

  std::map<size_t, Piece> _taken;
  std::map<size_t, size_t> _free;                   // offset to bytes
  std::set<std::pair<size_t, size_t>> _freeBySize;  // the same pieces: bytes, offset
  uint64_t _lastTicket = 0;
};

}  // namespace android
