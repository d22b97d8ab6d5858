// Map script of the classic page template: shows the positions of track0 (track_data.js, loaded
// before this script) in the element with the id "map". Each entry of track0 is
// [time (seconds since 1970, UTC), latitude, longitude, altitude (m), speed (km/h), 0, 0, 0].
// With the Google Maps API loaded on the page the positions become markers on a map; without
// it they are listed as text, so the page still says where its owner is.
(function () {
  function describe(p) {
    return new Date(p[0] * 1000).toISOString().replace('.000Z', 'Z') + '  ' + p[1].toFixed(6) + ', ' +
        p[2].toFixed(6) + '  ' + p[3].toFixed(0) + ' m  ' + p[4].toFixed(1) + ' km/h';
  }
  function show() {
    var element = document.getElementById('map');
    if (!element || typeof track0 === 'undefined' || track0.length === 0) return;
    var last = track0[track0.length - 1];
    if (typeof google === 'undefined' || !google.maps) {
      element.textContent = track0.map(describe).join('\n');
      return;
    }
    var map = new google.maps.Map(element, {center: {lat: last[1], lng: last[2]}, zoom: 15});
    track0.forEach(function (p) {
      new google.maps.Marker({position: {lat: p[1], lng: p[2]}, map: map, title: describe(p)});
    });
  }
  if (document.readyState === 'loading') document.addEventListener('DOMContentLoaded', show);
  else show();
})();
