#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>
#include <iostream>

#include "platform/HTTPFileOutputer.h"
#include "tests/host/download/Exchange.h"
#include "tests/support/TempFolder.h"

namespace {

using exchange::Ask;
using exchange::Get;
using exchange::Output;
using exchange::Reply;

// Whoever has written the first header lines did it through one of these.
enum class Way { Stdio, UnbufferedStdio, Cout, CoutOfItsOwn, Descriptor };

void WriteLine(Way way) {
    const std::string line = "X-First: one\r\n";
    static char buffer[1 << 16];
    switch (way) {
        case Way::Stdio:
            EXPECT_EQ(setvbuf(stdout, buffer, _IOFBF, sizeof buffer), 0);
            (void)fwrite(line.data(), 1, line.size(), stdout);
            break;
        case Way::UnbufferedStdio:
            EXPECT_EQ(setvbuf(stdout, nullptr, _IONBF, 0), 0);
            (void)fwrite(line.data(), 1, line.size(), stdout);
            break;
        case Way::Cout:
            EXPECT_EQ(setvbuf(stdout, buffer, _IOFBF, sizeof buffer), 0);
            std::cout << line;
            break;
        case Way::CoutOfItsOwn:
            (void)std::ios::sync_with_stdio(false);
            std::cout << line;
            break;
        case Way::Descriptor:
            (void)!write(STDOUT_FILENO, line.data(), line.size());
            break;
    }
}

TEST(OutputOrder, KeepsWhatWasWrittenBeforeInFrontWhateverTheBuffer) {
    const support::TempFolder folder;
    const std::string small = folder.Write("small", "hello");
    const std::string large = folder.Write("large", exchange::Pattern(300000));
    for (const Way way :
         {Way::Stdio, Way::UnbufferedStdio, Way::Cout, Way::CoutOfItsOwn, Way::Descriptor}) {
        for (const std::string& path : {small, large, folder.Path("absent")}) {
            const Reply plain = exchange::AskForPath(path);
            for (const Output kind :
                 {Output::Pipe, Output::Socket, Output::File, Output::NonBlockingPipe}) {
                const Reply reply = Ask(
                    Get(),
                    [&] {
                        WriteLine(way);
                        return exchange::Told(
                            HTTPFileOutputer().Output(path.c_str(), "text/plain"));
                    },
                    kind);
                EXPECT_EQ(reply.status, plain.status);
                EXPECT_TRUE(reply.raw == "X-First: one\r\n" + plain.raw)
                    << static_cast<int>(way) << " " << path << " " << static_cast<int>(kind);
            }
        }
    }
}

TEST(OutputOrder, KeepsWhatIsWrittenAfterwardsBehind) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "hello");
    const Reply reply = Ask(Get(), [&] {
        const int result = HTTPFileOutputer().Output(path.c_str(), "x/y");
        (void)fputs("!", stdout);
        std::cout << "?";
        return exchange::Told(result);
    });
    EXPECT_EQ(reply.Body(), "hello!?");
}

TEST(OutputOrder, HoldsWithMoreInFrontThanAPipeTakes) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "hello");
    const std::string lines = "X-Long: " + std::string(300000, 'x') + "\r\n";
    for (const Output kind : {Output::Pipe, Output::NonBlockingPipe}) {
        const Reply reply = Ask(
            Get(),
            [&] {
                static char buffer[1 << 20];
                EXPECT_EQ(setvbuf(stdout, buffer, _IOFBF, sizeof buffer), 0);
                (void)fwrite(lines.data(), 1, lines.size(), stdout);
                return exchange::Told(HTTPFileOutputer().Output(path.c_str(), "x/y"));
            },
            kind);
        EXPECT_EQ(reply.status, exchange::kSent);
        EXPECT_EQ(reply.raw.substr(0, lines.size()), lines);
        EXPECT_EQ(reply.Body(), "hello");
    }
}

}  // namespace
