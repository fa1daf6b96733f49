#pragma once
// The gesture stream: every scale, rotation and scroll event the filter delivers, with its
// phase, as one line of event JSON (FORMATS.md section 2: the event itself, without the
// pointer event that carried it), in the order delivered. Clients connect to a Unix stream
// socket and read lines; standard output gets the same lines with --print.
//
// Nothing here ever blocks the input path: writes are non-blocking, what a client has not
// taken yet waits in a buffer of bounded size, and a client whose buffer would overflow, or
// that has gone away, is dropped (its connection closed). Standard output is never dropped:
// when it cannot take a line, the line is left out and counted.

#include <poll.h>

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "platform/HIDEvent.h"

namespace orvane::live {

class GestureStream {
public:
    // What one client may have waiting before it is dropped.
    static constexpr size_t kDefaultClientBufferBytes = 64 * 1024;
    // Connections kept at once; more are closed as they arrive.
    static constexpr size_t kMaximumClients = 32;

    explicit GestureStream(size_t clientBufferBytes = kDefaultClientBufferBytes);
    ~GestureStream();
    GestureStream(const GestureStream&) = delete;
    GestureStream& operator=(const GestureStream&) = delete;

    // Listens on a Unix stream socket at `path`. A socket file left behind by a process that
    // is gone is replaced; one that still answers, or any other file, is an error.
    bool listen(const std::string& path, std::string* error);
    // Also writes every line to this descriptor (standard output): a line when the
    // descriptor has room for it at once (a pipe always takes a line shorter than its
    // 4 KiB atomic write whole when it says it has room), otherwise the line is left out.
    void printTo(int descriptor);

    // One event the filter delivered: a line for it, or for each of its children, that is a
    // scale, rotation or scroll event.
    void deliver(const HIDEvent& event);
    // One line (without its line break) to every client and to the printed output.
    void publish(std::string_view line);

    // Accepts clients that are waiting, reads and discards what clients send, notices the
    // ones that hung up and writes what is waiting; never blocks.
    void service();
    // The descriptors to wait on for service(): the listening socket and every client
    // (for output when something waits for it).
    void appendPollDescriptors(std::vector<pollfd>* descriptors) const;
    // Tries, for at most `milliseconds`, to write what is still waiting (at shutdown).
    void flush(int milliseconds);

    bool isListening() const { return listener_ >= 0; }
    const std::string& socketPath() const { return path_; }
    size_t clientCount() const { return clients_.size(); }
    uint64_t linesPublished() const { return linesPublished_; }
    uint64_t clientsDropped() const { return clientsDropped_; }
    uint64_t printedLinesLeftOut() const { return printedLinesLeftOut_; }

private:
    struct Client {
        int descriptor = -1;
        std::string waiting;  // bytes not yet taken
        size_t taken = 0;     // of `waiting`
    };

    void accept();
    // Writes what waits; false when the client is to be dropped.
    bool send(Client& client);
    void drop(size_t index);
    void print(std::string_view line);

    size_t clientBufferBytes_;
    int listener_ = -1;
    std::string path_;
    std::vector<Client> clients_;
    int printed_ = -1;
    std::string line_;       // reused for every line
    std::string printing_;   // the line being printed
    uint64_t linesPublished_ = 0;
    uint64_t clientsDropped_ = 0;
    uint64_t printedLinesLeftOut_ = 0;
};

}  // namespace orvane::live
