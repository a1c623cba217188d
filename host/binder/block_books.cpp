#include "host/binder/block_books.h"

#include <iterator>

namespace android {

BlockBooks::BlockBooks(size_t bytes) {
  if (bytes >= kGrain) addFree(0, bytes / kGrain * kGrain);
}

std::optional<BlockBooks::Piece> BlockBooks::take(size_t bytes) {
  if (bytes > SIZE_MAX - (kGrain - 1)) return std::nullopt;
  const size_t needed = (bytes + kGrain - 1) / kGrain * kGrain;
  const auto best = _freeBySize.lower_bound({needed, 0});
  if (best == _freeBySize.end()) return std::nullopt;

  const auto [found, offset] = *best;
  _freeBySize.erase(best);
  _free.erase(offset);
  if (found > needed) addFree(offset + needed, found - needed);
  const Piece piece{offset, needed, ++_lastTicket};
  _taken.emplace(offset, piece);
  return piece;
}

std::optional<BlockBooks::Piece> BlockBooks::giveBack(size_t offset, uint64_t ticket) {
  const auto entry = _taken.find(offset);
  if (entry == _taken.end()) return std::nullopt;
  if (ticket != kAnyTicket && entry->second.ticket != ticket) return std::nullopt;
  const Piece piece = entry->second;
  _taken.erase(entry);
  addFree(piece.offset, piece.bytes);
  return piece;
}

void BlockBooks::addFree(size_t offset, size_t bytes) {
  auto next = _free.lower_bound(offset);
  if (next != _free.end() && offset + bytes == next->first) {
    bytes += next->second;
    _freeBySize.erase({next->second, next->first});
    next = _free.erase(next);
  }
  if (next != _free.begin()) {
    const auto previous = std::prev(next);
    if (previous->first + previous->second == offset) {
      offset = previous->first;
      bytes += previous->second;
      _freeBySize.erase({previous->second, previous->first});
      _free.erase(previous);
    }
  }
  _free.emplace(offset, bytes);
  _freeBySize.emplace(bytes, offset);
}

}  // namespace android
