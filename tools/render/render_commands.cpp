// The program's requests.
#include "render/render_commands.h"

#include <fmt/format.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <filesystem>
#include <mutex>
#include <optional>
#include <span>
#include <stdexcept>
#include <string>
#include <vector>

#include "render/data_check.h"
#include "render/library_log.h"
#include "render/listing.h"
#include "render/output_file.h"
#include "render/rendering.h"
#include "render/rooms.h"
#include "render/single_source.h"
#include "scene/scene_file.h"

namespace tessaly {

namespace {

constexpr const char* introduction =
    "Rendered through the Tessaly library, block by block as a game's mixer runs it. For "
    "headphones.";

void warn(const std::string& line) { fmt::print(stderr, "tessaly-render: warning: {}\n", line); }

void warnOfCut(std::size_t cut, const std::string& remedy) {
    if (cut > 0) {
        warn(fmt::format("{} samples were cut at full scale: lower {}", cut, remedy));
    }
}

void warnAll(const std::vector<std::string>& warnings) {
    for (const std::string& line : warnings) {
        warn(line);
    }
}

void tell(const std::string& line) {
    if (isatty(STDERR_FILENO) == 1) {
        fmt::print(stderr, "{}\n", line);
    }
}

void refuseToOverwrite(const std::filesystem::path& input, const std::filesystem::path& output) {
    std::error_code ignored;
    if (!input.empty() && !output.empty() && std::filesystem::equivalent(input, output, ignored)) {
        throw std::runtime_error(
            fmt::format("{} is the input and cannot be the output too", output.string()));
    }
}

// The file of the page, empty for none.
std::filesystem::path pageOf(const RenderOptions& options) {
    return options.report.empty() ? std::filesystem::path() : options.report / "index.html";
}

void refuseToOverwriteInputs(const std::filesystem::path& sceneFile,
                             const Scene& scene,
                             const RenderOptions& options) {
    for (const std::filesystem::path& written :
         {options.output, options.picture, pageOf(options)}) {
        refuseToOverwrite(sceneFile, written);
        for (const SceneSource& source : scene.sources) {
            refuseToOverwrite(source.input.file, written);
        }
    }
}

void openIfWanted(std::optional<PendingFile>& file, const std::filesystem::path& place) {
    if (!place.empty()) {
        file.emplace(place);
    }
}

std::string pageText(const RenderOptions& options) {
    return options.report.empty() ? "" : ", page " + pageOf(options).string();
}

// The page's place, taken before the work and given back if nothing comes of it.
class PendingPage {
public:
    explicit PendingPage(const RenderOptions& options)
        : directory(options.report), file(pageOf(options)) {}

    void write(const Report& report) {
        writeText(file, reportPage(report));
        file.complete();
    }

private:
    NewDirectory directory;
    PendingFile file;
};

void openIfWanted(std::optional<PendingPage>& page, const RenderOptions& options) {
    if (!options.report.empty()) {
        page.emplace(options);
    }
}

// The sound and picture of one rendering, and the page, in this order.
void finish(const RenderOptions& options,
            std::optional<PendingFile>& sound,
            std::optional<PendingFile>& picture,
            std::optional<PendingPage>& page,
            std::vector<Rendering>&& renderings,
            const std::string& remedy) {
    std::size_t cut = 0;
    if (sound) {
        cut = writeWav(*sound, renderings[0].result.stereo, renderings[0].scene.sampleRate,
                       options.format);
    }
    if (picture) {
        writeText(*picture, pictureOf(renderings[0].scene, renderings[0].inputs.duration,
                                      renderings[0].result.stereo));
    }
    const std::string title = !options.title.empty() ? options.title
                              : renderings.size() == 1 && !renderings[0].scene.title.empty()
                                  ? renderings[0].scene.title
                                  : "Tessaly";
    std::vector<std::vector<std::string>> warnings;
    for (const Rendering& rendering : renderings) {
        warnings.push_back(rendering.result.warnings);
    }
    if (page) {
        page->write(reportOf(title, introduction, std::move(renderings)));
    }
    if (picture) {
        picture->complete();
    }
    if (sound) {
        sound->complete();
    }
    for (const std::vector<std::string>& lines : warnings) {
        warnAll(lines);
    }
    warnOfCut(cut, remedy);
}

// "05_FamousConcerthall.wav": names without blanks.
std::filesystem::path roomFile(const std::filesystem::path& directory,
                               int room,
                               const char* extension) {
    std::string name = fmt::format("{:02}_{}{}", room, roomAt(room).name, extension);
    std::replace(name.begin(), name.end(), ' ', '_');
    return directory / name;
}

// Files of one room.
struct RoomFiles {
    std::optional<PendingFile> sound;
    std::optional<PendingFile> picture;
};

void openRoom(RoomFiles& files, const RenderOptions& options, int room) {
    const std::filesystem::path sound = roomFile(options.output, room, ".wav");
    const std::filesystem::path picture =
        options.roomPictures ? roomFile(options.output, room, ".svg") : std::filesystem::path();
    refuseToOverwrite(options.input, sound);
    refuseToOverwrite(options.input, picture);
    files.sound.emplace(sound);
    openIfWanted(files.picture, picture);
}

Scene inRoom(const Scene& scene, int room) {
    Scene result = scene;
    result.title = fmt::format("{:02} {}", room, roomAt(room).name);
    result.description = scene.title;
    result.sources[0].room = room;
    return result;
}

}  // namespace

void renderOneSound(const RenderOptions& options) {
    // Everything that can be refused is refused before the work begins.
    PluginLibrary::locate(options.library);
    Scene scene = sceneOf(options);
    checkData(options.dataDirectory, scene);
    refuseToOverwriteInputs({}, scene, options);
    std::optional<PendingFile> sound;
    std::optional<PendingFile> picture;
    openIfWanted(sound, options.output);
    openIfWanted(picture, options.picture);
    std::optional<PendingPage> page;
    openIfWanted(page, options);
    std::vector<Rendering> renderings(1);
    renderings[0].inputs = loadInputs(scene);
    const double duration = renderings[0].inputs.duration;
    settleOrbit(scene, options, duration);
    renderings[0].scene = scene;
    renderAll(options, renderings, [](std::size_t) {});
    finish(options, sound, picture, page, std::move(renderings), "it, e.g. --set Gain=-6");
    tell(fmt::format("{}{:.1f} s{}{}", sound ? options.output.string() + ": " : "", duration,
                     picture ? ", picture " + options.picture.string() : "", pageText(options)));
}

void renderScenes(const RenderOptions& options) {
    PluginLibrary::locate(options.library);
    std::vector<Rendering> renderings;
    for (const std::filesystem::path& file : options.scenes) {
        Rendering& rendering = renderings.emplace_back();
        rendering.scene = readScene(file);
        if (options.rateGiven) {
            rendering.scene.sampleRate = options.sampleRate;
        }
        if (options.blockGiven) {
            rendering.scene.blockLength = options.blockLength;
        }
        if (rendering.scene.title.empty()) {
            rendering.scene.title = file.stem().string();
        }
        checkData(options.dataDirectory, rendering.scene);
        refuseToOverwriteInputs(file, rendering.scene, options);
    }
    std::optional<PendingFile> sound;
    std::optional<PendingFile> noPicture;
    openIfWanted(sound, options.output);
    std::optional<PendingPage> page;
    openIfWanted(page, options);
    for (Rendering& rendering : renderings) {
        rendering.inputs = loadInputs(rendering.scene);
    }
    renderAll(options, renderings, [](std::size_t) {});
    const double duration = renderings[0].inputs.duration;
    finish(options, sound, noPicture, page, std::move(renderings), "the sources' gain");
    tell(sound ? fmt::format("{}: {:.1f} s{}", options.output.string(), duration, pageText(options))
               : "page " + pageOf(options).string());
}

void renderEveryRoom(const RenderOptions& options) {
    PluginLibrary::locate(options.library);
    Scene scene = sceneOf(options);
    std::vector<Rendering> renderings(roomCount);
    for (int room = 0; room < roomCount; ++room) {
        renderings[static_cast<std::size_t>(room)].scene = inRoom(scene, room);
        checkData(options.dataDirectory, renderings[static_cast<std::size_t>(room)].scene);
    }
    refuseToOverwrite(options.input, pageOf(options));
    std::optional<NewDirectory> directory;
    std::array<RoomFiles, roomCount> files;
    if (!options.output.empty()) {
        directory.emplace(options.output);
        for (int room = 0; room < roomCount; ++room) {
            openRoom(files[static_cast<std::size_t>(room)], options, room);
        }
    }
    std::optional<PendingPage> page;
    openIfWanted(page, options);
    const SceneInputs inputs = loadInputs(scene);
    settleOrbit(scene, options, inputs.duration);
    for (int room = 0; room < roomCount; ++room) {
        Rendering& rendering = renderings[static_cast<std::size_t>(room)];
        rendering.inputs = inputs;
        rendering.scene = inRoom(scene, room);
    }
    std::mutex guard;
    std::size_t cut = 0;
    renderAll(options, renderings, [&](std::size_t i) {
        Rendering& done = renderings[i];
        const std::size_t here = files[i].sound ? writeWav(*files[i].sound, done.result.stereo,
                                                           done.scene.sampleRate, options.format)
                                                : 0;
        if (files[i].picture) {
            Scene titled = done.scene;
            titled.title = scene.title;
            writeText(*files[i].picture, pictureOf(titled, inputs.duration, done.result.stereo));
        }
        done.inputs.sounds.clear();
        done.result.sourceOutputs.clear();
        if (options.report.empty()) {
            done.result.stereo.clear();
        }
        const std::lock_guard lock(guard);
        cut += here;
    });
    for (const Rendering& done : renderings) {
        for (const std::string& line : done.result.warnings) {
            warn(fmt::format("{}: {}", done.scene.title, line));
        }
    }
    if (page) {
        const std::string title =
            options.title.empty() ? scene.title + " in every room" : options.title;
        page->write(reportOf(title, introduction, std::move(renderings)));
    }
    for (RoomFiles& one : files) {
        if (one.picture) {
            one.picture->complete();
        }
        if (one.sound) {
            one.sound->complete();
        }
    }
    warnOfCut(cut, "it, e.g. --set Gain=-6");
    tell(fmt::format("{}{} rooms, {:.1f} s each{}", directory ? options.output.string() + ": " : "",
                     roomCount, inputs.duration, pageText(options)));
}

void printListing(const RenderOptions& options) {
    const LibraryLog log(options.verbose);
    const PluginLibrary library(PluginLibrary::locate(options.library));
    fmt::print("{}", listing(library));
}

}  // namespace tessaly
