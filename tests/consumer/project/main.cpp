// Uses the installed library through its installed headers: a checksum, a path text, a
// message through a message manager, and the application name. Exits 0 when each gives what
// the library promises.
#include <iostream>
#include <sstream>

#include "Port_Msg.h"
#include "Port_String.h"
#include "Tesu_MsgMan.h"
#include "Tesu_Utilities.h"

int main() {
    int failures = 0;
    auto expect = [&failures](bool good, const char* what) {
        if (!good) {
            std::cerr << "consumer: wrong " << what << '\n';
            ++failures;
        }
    };

    Port::StringBase<char> checksum;
    Tesu::Utilities::CalculateChecksum("1234\n# a comment\n56789\n", checksum);
    expect(checksum.str() == "cbf43926", "checksum");

    expect(Tesu::Utilities::IsTerminatedWithPathSeparator("dir/"), "separator test");
    expect(Tesu::Utilities::ApplicationName().str() == "Quarnel Tessel", "application name");

    std::ostringstream captured;
    {
        Tesu::MsgMan messages(Tesu::MsgMan::DIAG_SILENT);
        messages.addMsgStream(captured);
        Port_MsgManData::createObject("consumer", "main.cpp", __LINE__, "1")
            .issueWarning("installed package in use\n");
        messages.removeMsgStream(captured);
    }
    expect(captured.str() == "WARNING:consumer - installed package in use\n", "message");

    std::cout << "consumer: " << (failures == 0 ? "OK" : "FAILED") << '\n';
    return failures == 0 ? 0 : 1;
}
