#include "Rewrite.h"

#include "../AtomicOutput.h"
#include "../FileBytes.h"
#include "../Json.h"
#include "../MovieRewrite.h"
#include "../Progress.h"
#include "../ToolError.h"

#include <chrono>
#include <future>

namespace {

std::uint64_t bytesMoved(RewritePlan const& plan)
{
    std::uint64_t sum = 0;
    for (AtomChange const& change : plan.changes)
        sum += change.depth == 0 && change.kind == AtomChange::Moved ? change.after->size : 0;
    return sum;
}

bool isListed(AtomChange const& change)
{
    return change.kind != AtomChange::Same &&
           (change.depth == 0 || change.kind != AtomChange::Moved);
}

void printPlan(RewritePlan const& plan, RewriteOptions const& options)
{
    auto const shiftOf = [&](ChunkTable const& table) {
        return table.chunks.empty() ? 0 : plan.shift;
    };
    if (options.json) {
        Json document = {{"in", options.input},
                         {"out", options.output},
                         {"bytes_moved", bytesMoved(plan)},
                         {"atoms", Json::array()},
                         {"tables", Json::array()}};
        for (AtomChange const& change : plan.changes) {
            if (!isListed(change))
                continue;
            Json entry = {{"path", change.path}, {"change", AtomChange::kindNames[change.kind]}};
            for (auto const& [key, atom] :
                 {std::pair{"before", change.before}, std::pair{"after", change.after}})
                if (atom)
                    entry[key] = {{"offset", atom->offset}, {"size", atom->size}};
            document["atoms"].push_back(std::move(entry));
        }
        for (ChunkTable const& table : plan.tables)
            document["tables"].push_back({{"path", table.path},
                                          {"offsets", table.chunks.size()},
                                          {"shift", shiftOf(table)}});
        return printJson(document);
    }
    std::string text;
    for (AtomChange const& change : plan.changes) {
        if (!isListed(change))
            continue;
        text += AtomChange::marks[change.kind] + std::string(" ") + change.path + ": ";
        MovieAtom const *before = change.before, *after = change.after;
        switch (change.kind) {
        case AtomChange::New:
            text += "new, " + std::to_string(after->size) + " bytes";
            break;
        case AtomChange::Gone:
            text += "gone, " + std::to_string(before->size) + " bytes";
            break;
        case AtomChange::Moved:
            text += std::to_string(after->size) + " bytes move from " +
                    std::to_string(before->offset) + " to " + std::to_string(after->offset);
            break;
        default:
            text += "changed, " + std::to_string(before->size) + " to " +
                    std::to_string(after->size) + " bytes";
            break;
        }
        text += "\n";
    }
    for (ChunkTable const& table : plan.tables)
        text += "  " + table.path + ": " + std::to_string(table.chunks.size()) +
                " offsets, shifted by " + std::to_string(shiftOf(table)) + "\n";
    text += std::to_string(bytesMoved(plan)) + " bytes move.\n";
    printOutput(text);
}

/// Shows a bar while another thread writes.
int writeWithProgress(KVAtomBoxFile& file)
{
    auto writing =
        std::async(std::launch::async, [&] { return file.writeAtomBoxFileWithUpdates(); });
    Progress progress("writing", 100);
    while (writing.wait_for(std::chrono::milliseconds(50)) != std::future_status::ready)
        progress.update(static_cast<std::uint64_t>(file.getWritePercentDone()));
    return writing.get();
}

char const* describe(int code)
{
    switch (code) {
    case -3:
        return "the disk is full, or the file too large";
    case -4:
        return "not permitted";
    case -5:
        return "the device failed";
    default:
        return "the movie could not be copied";
    }
}

} // namespace

void addRewriteOptions(CLI::App& command, RewriteOptions& options)
{
    command.add_option("IN", options.input, "A QuickTime or MP4 file")->required();
    command.add_option("OUT", options.output, "The file to write; another one")->required();
    command.add_flag("--dry-run", options.dryRun, "Print what would change and write nothing");
    command.add_flag("--no-verify", options.noVerify,
                     "Do not compare the samples of both files afterwards");
    addJsonFlag(command, options.json);
}

void rewrite(KVAtomBoxFile& file, RewriteOptions const& options)
{
    RewritePlan const plan = planRewrite(file, options.input);
    checkRewrite(plan, options.input);
    if (options.dryRun)
        return printPlan(plan, options);

    AtomicOutput output(options.output);
    KVURL const url(output.temporaryPath().c_str());
    if (url.isNull())
        throw inputOutput(options.output, "its name is not UTF-8");
    if (int const code = file.openOutputFile(url.cf_url()))
        throw inputOutput(options.output, describe(code));
    if (int const code = writeWithProgress(file))
        throw inputOutput(options.output, describe(code));
    file.closeOutputFile();
    std::uint64_t const compared =
        options.noVerify ? 0 : verifyRewrite(options.input, output.temporaryPath());
    output.commit();
    if (options.json)
        return printPlan(plan, options);
    printMessage(options.output + ": written" +
                 (options.noVerify
                      ? std::string()
                      : ", " + std::to_string(compared) + " bytes of samples compared"));
}

void checkPaths(RewriteOptions const& options)
{
    if (FileBytes::isSameFile(options.input, options.output))
        throw ToolError(ExitCode::Usage, options.output + ": is the input; write to another file");
}

void checkDescriptions(KVAtomBoxFile& file, KVAtomBox const& track, std::string const& path)
{
    auto const original = KVCFRef<CFMutableDataRef>::adopt(new __CFData());
    if (file.readTrackSampleDescription(&track, original) != 0)
        throw badInput(path, "a video track has no sample description");
    KVImageDescAtomBox descriptions(original);
    for (bool const quickTime : {false, true}) {
        auto const again = descriptions.copyFullImageDescToData(quickTime);
        if (again && CFEqual(again, original))
            return;
    }
    throw ToolError(ExitCode::Failed,
                    path + ": the sample description of a video track holds bytes that are in no "
                           "atom and would be lost; nothing was written");
}
