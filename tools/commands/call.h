// A call with both ends in this process:
//
//   source -> encoder -> link -> decoder -> writer
//     main   |        |        |         |  <- threads: the main one feeds the encoder; the encoder's
//            |  its output     |            output thread queues what it made; the link's thread keeps the
//            |  thread    link's thread     stream and feeds the decoder; the decoder's output thread
//            |                              compares each picture with its source and writes it
//
// What was sent is found again by its time stamp, which travels through both components.
#pragma once

#include <stdint.h>

#include <memory>
#include <optional>
#include <stop_token>
#include <string>

#include "tools/base/failure.h"
#include "tools/commands/call_book.h"
#include "tools/commands/sender.h"
#include "tools/files/frame_source.h"
#include "tools/h264/headers.h"
#include "tools/network/lossy_path.h"
#include "tools/report/snapshots.h"

namespace tool {

struct CallSettings {
  SenderSettings sender;
  Impairments impairments;     // of the way between the ends
  std::string streamPath;      // the coded stream (Annex B); empty: not kept
  std::string picturesPath;    // the decoded pictures; empty: not kept
  std::string picturesFormat;  // see createPictureWriter()
  std::string reportPath;      // an HTML file; empty: none
  std::string inputName;       // for the report
  std::vector<SnapshotRequest> snapshots;
};

struct CallReport {
  std::string input;  // as the user named it; empty: the built-in scene
  CallFigures figures;
  CallTrace trace;
  EncoderSettings encoder;
  Impairments impairments;
  PathFigures path;
  double seconds = 0;                    // of video
  double meanBitRate = 0;                // asked for, bits per second
  std::optional<SequenceInfo> sequence;  // what the stream says of itself
  int hardwareVersion = 0;
  double wallSeconds = 0;
  double cpuSeconds = 0;  // of the whole process, all threads, components included
  Outcome inputFailure;   // the input broke off; the call went on with what there was
};

// Runs the call on the calling thread. `enough` is requested to end it early, by Ctrl-C from outside and by
// a failure from inside; the source stops reading at it. Files get their names only at a good end.
Result<CallReport> runCall(const CallSettings& settings, FrameSource& source, std::stop_source& enough);

}  // namespace tool
