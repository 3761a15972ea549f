#pragma once

namespace Corvo::Plugins {

// Which plug-in a file is. Every file has its own definition of this one,
extern const char* const kChosenPlugin;  // a row's id

// and these follow from it.
const char* ChosenName();
const char* ChosenUri();
const char* ChosenVst3Category();

}  // namespace Corvo::Plugins
