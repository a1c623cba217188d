// How many bits an encoder library has to be asked for so that a stream keeps its bit rate.
//
// The library spreads bits over pictures at the frame rate that it was opened with, and of what it was asked
// for re-reads the bit rate and the size of its buffer alone. It reacts slowly, and by itself ends up some
// per cent short. So it is asked anew before each picture: scaled to the frame rate of the moment, with a
// part of what was saved or overspent so far, and with a small buffer for a second after each change, which
// makes it forget what it learnt at the former rate. Plain arithmetic, one thread.
#pragma once

namespace mediaserver {

class RateBudget {
 public:
  // `openedAt`: frames per second; `buffered`: seconds that the library may borrow and save in steady state.
  RateBudget(double openedAt, double buffered) : _openedAt(openedAt), _buffered(buffered) {}

  // The rates from the next picture on; a change of either begins a new account. Both above 0.
  void set(double bitsPerSecond, double framesPerSecond);

  struct Request {
    double bitsPerSecond;  // in the library's own time
    double bufferBits;
  };
  // Before each picture.
  Request next() const;
  // After it.
  void spent(double bits);

 private:
  const double _openedAt;
  const double _buffered;
  double _bitsPerSecond = 0;
  double _framesPerSecond = 1;
  double _saved = 0;     // bits; negative: overspent
  double _settling = 0;  // seconds until the buffer may grow again
};

}  // namespace mediaserver
