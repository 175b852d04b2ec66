// process_tiles: one filter over a picture file of any size, tile by tile. See TileOptions.cpp for the
// command line.
#include "common/Program.h"
#include "process_tiles/TileOptions.h"
#include "process_tiles/TileRunner.h"

#include <cstdio>

int main(int argc, char** argv) {
    return example::runProgram("process_tiles", [&] {
        example::TileOptions const options = example::parseTileOptions(argc, argv);
        if (options.help) {
            std::fputs(example::tileUsageText, stdout);
            return true;
        }
        example::RequestedEngine const engine(options);
        return example::processTiles(options, engine.context.get());
    });
}
