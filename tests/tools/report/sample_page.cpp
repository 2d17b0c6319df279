// Writes a page with the sample report into the directory given, for the test in a browser.
#include <cstdio>
#include <exception>

#include "report/report.h"
#include "tools/report/sample_report.h"

int main(int argumentCount, char** arguments) {
    if (argumentCount != 2) {
        std::fputs("usage: report_sample_page DIR\n", stderr);
        return 2;
    }
    try {
        tessaly::writeReport(tessaly::sampleReport(), arguments[1]);
        return 0;
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "report_sample_page: %s\n", failure.what());
        return 1;
    }
}
