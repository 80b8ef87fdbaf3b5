#include "scenetool_app.h"

int main(int argc, char** argv) { return scenetool::run(argc, argv); }
