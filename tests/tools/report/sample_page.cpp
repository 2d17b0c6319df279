// Writes a page with the sample report into the directory given, for the test in a browser.
#include <cstdio>
#include <exception>
#include <filesystem>
#include <fstream>
#include <stdexcept>

#include "report/report.h"
#include "tools/report/sample_report.h"

int main(int argumentCount, char** arguments) {
    if (argumentCount != 2) {
        std::fputs("usage: report_sample_page DIR\n", stderr);
        return 2;
    }
    try {
        const std::filesystem::path directory = arguments[1];
        std::filesystem::create_directories(directory);
        std::ofstream page(directory / "index.html", std::ios::binary);
        page << tessaly::reportPage(tessaly::sampleReport());
        page.close();
        if (!page) {
            throw std::runtime_error("cannot write into " + directory.string());
        }
        return 0;
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "report_sample_page: %s\n", failure.what());
        return 1;
    }
}
