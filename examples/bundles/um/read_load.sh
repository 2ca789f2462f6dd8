#!/bin/sh
# Prints how busy this machine is, as the data agent shows it.
read -r one five fifteen _ </proc/loadavg
cat <<END
# HELP sample_load Processes that run or want to, on average over so many minutes.
# TYPE sample_load gauge
sample_load{minutes="1"} $one
sample_load{minutes="5"} $five
sample_load{minutes="15"} $fifteen
END
