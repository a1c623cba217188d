// A way from the encoder to the decoder that loses, reorders and delays packets, with the receiver at its
// end. It runs in the time of the video, not in real time, and its accidents come from a seed: the same
// pictures meet the same fate on every machine, however fast. One thread at a time.
//
// The receiver puts packets into order, waits a little for late ones, and gives a picture on when it is
// whole. After a loss it holds everything back and asks for a key frame, again and again, until one is
// there. A request takes as long to the sender as a packet to the receiver.
#pragma once

#include <stddef.h>
#include <stdint.h>

#include <deque>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <queue>
#include <random>
#include <vector>

#include "tools/network/link.h"

namespace tool {

struct Impairments {
  double loss = 0;     // of packets, 0 to 1
  double reorder = 0;  // of packets: they come late enough to be overtaken
  int64_t delay = 0;   // microseconds, one way
  uint64_t seed = 1;

  bool any() const { return loss > 0 || reorder > 0 || delay > 0; }
};

struct PathFigures {
  uint64_t packets = 0;
  uint64_t packetsLost = 0;
  uint64_t packetsReordered = 0;
  uint64_t picturesLost = 0;         // did not come out, or not yet
  std::vector<int64_t> losses;       // when pictures with lost packets were sent, microseconds
  std::vector<int64_t> keyRequests;  // when they were made
};

class LossyPath {
 public:
  explicit LossyPath(const Impairments& impairments);

  // Sends a coded picture, in packets, at this time of the video (never before the one before).
  void send(CodedPicture picture, int64_t time);
  // The pictures that come out until `now`, in order; their `networkDelay` is filled in.
  std::vector<CodedPicture> advance(int64_t now);
  // All that is still on its way.
  std::vector<CodedPicture> drain();
  // Whether a key-frame request has reached the sender since the last time it was asked.
  bool takeKeyRequest(int64_t now);

  const PathFigures& figures() const { return _figures; }

 private:
  // A picture under way; its packets are numbered from `first` on.
  struct Sent {
    CodedPicture picture;
    int64_t time;
    uint64_t first;
    uint64_t count;
  };
  struct Packet {
    uint64_t number;
    int64_t arrival;
    std::shared_ptr<Sent> of;
    bool operator>(const Packet& other) const {
      return arrival != other.arrival ? arrival > other.arrival : number > other.number;
    }
  };

  double chance();
  bool takeWholePicture(int64_t now);
  std::optional<int64_t> nextAlarm() const;
  void giveUpGap(int64_t now);
  void requestKey(int64_t now);

  const Impairments _impairments;
  std::mt19937_64 _random;
  std::priority_queue<Packet, std::vector<Packet>, std::greater<>> _underWay;
  uint64_t _nextToSend = 0;
  int64_t _clock = 0;   // of the last thing that happened at the receiver
  bool _ended = false;  // nobody answers requests any more

  // The receiver's.
  std::map<uint64_t, Packet> _waiting;  // arrived, by number
  uint64_t _next = 0;                   // the first packet not dealt with
  bool _frozen = false;                 // until a key frame is there
  int64_t _lastRequest = 0;
  std::vector<CodedPicture> _out;

  std::deque<int64_t> _requestsUnderWay;  // when they reach the sender
  PathFigures _figures;
};

}  // namespace tool
