#include "app/ReportScriptCommands.h"

#include <fstream>
#include <mutex>
#include <string>
#include <vector>

#include "app/BatchRunner.h"
#include "app/DocumentStateReport.h"
#include "app/ScriptArguments.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

using Arguments = BatchRunner::Arguments;

void ReportScriptCommands::AddTo(BatchRunner& runner, std::FILE* output)
{
    runner.AddCommand("print", 0, 0, [&runner, output](const Arguments&, std::string*) {
        const std::string json = DocumentStateReport::Json(*runner.Window());
        std::fprintf(output, "%s\n", json.c_str());
        std::fflush(output);
        return true;
    });
    runner.AddCommand("samples", 2, 2, [&runner](const Arguments& arguments, std::string* reason) {
        int32_t index = 0;
        if (!ScriptArguments::ChannelIndex(runner.Window(), arguments[0], &index, reason))
            return false;
        std::ofstream file(arguments[1], std::ios::binary | std::ios::trunc);
        if (!file)
            return ScriptArguments::Fail(reason, "cannot write " + arguments[1]);
        ChannelManager* manager = runner.Window()->Manager();
        std::lock_guard documentLock(manager->DocumentLock());
        Channel* channel = manager->ChannelAt(index);
        // Little-endian whatever the machine.
        std::vector<char> bytes;
        channel->ReadSpans(0, channel->FrameCount(), [&bytes](const SampleSpan& span) {
            for (int64_t i = 0; i < span.count; ++i) {
                const auto value = static_cast<uint16_t>(span.samples[i]);
                bytes.push_back(char(value & 0xff));
                bytes.push_back(char(value >> 8));
            }
        });
        file.write(bytes.data(), std::streamsize(bytes.size()));
        if (!file.flush())
            return ScriptArguments::Fail(reason, "cannot write " + arguments[1]);
        return true;
    });
}

}  // namespace glimmet
